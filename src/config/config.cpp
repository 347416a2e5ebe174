// rvConfig: the two-level table, the current and default sections, and the
// raw lookup and store on which every accessor rests.
#include <cstring>
#include <utility>

#include "config/class_lock.h"
#include "config/config_name.h"
#include "config/lookup.h"
#include "config/release.h"
#include "tessaline/config/rvConfig.h"
#include "util/load_time.h"

using tessaline::config::kMaxConfigName;
using tessaline::config::NameText;
using tessaline::config::ScopedClassLock;

const char* rvConfig::m_szCommentChars = "#;/";
const char* rvConfig::m_szSectionChars = "[]";
const char* rvConfig::m_szDelimChars = "=";
const char* rvConfig::m_szIdString = "# Edited by Tessaline";
const char* rvConfig::m_szDefaults = "defaults";
unsigned int rvConfig::m_bBackups = 0;
MMutex rvConfig::m_mutex TESSALINE_LOAD_TIME(MMutex_::MutexRecursive);

rvConfig::rvConfig()
{
    m_itSection = m_sections.end();
    Section(m_strDefaultSection.c_str(), 1);
}

rvConfig::rvConfig(const char* path, OpenMode mode)
{
    m_itSection = m_sections.end();
    Load(path, mode);
}

rvConfig::~rvConfig()
{
    Close(0);
    tessaline::config::ReleaseKeys(m_sections);
}

void rvConfig::Clear()
{
    ScopedClassLock lock;
    tessaline::config::ReleaseKeys(m_sections);
    m_sections.clear();
    m_nItems = 0;
    m_bModified = 0;
    m_strDefaultSection = cfgStr(m_szDefaults);
    m_strSection = cfgStr();
}

rvConfig::OpenMode rvConfig::Mode()
{
    return m_mode;
}

void rvConfig::Mode(OpenMode mode)
{
    m_mode = mode;
}

const char* rvConfig::ConfigName()
{
    return m_szConfigName;
}

void rvConfig::ConfigName(const char* name)
{
    if (name == nullptr) {
        name = "";
    }
    const std::size_t length = strnlen(name, kMaxConfigName);
    // Load passes ConfigName() back in on a reload.
    std::memmove(m_szConfigName, name, length);
    m_szConfigName[length] = '\0';
}

rvConfig::operator const char*()
{
    return ConfigName();
}

unsigned int rvConfig::Section(const char* name, unsigned int create)
{
    if (NameText(name).In(m_sections) != m_sections.end()) {
        m_strSection = cfgStr(name);
        return 1;
    }
    if (create == 0) {
        return 0;
    }
    cfgStr section(name);
    m_sections.insert(SectionTable::value_type(section, KeyTable()));
    ++m_nItems;
    m_strSection = std::move(section);
    return 1;
}

const char* rvConfig::Section()
{
    return m_strSection.c_str();
}

void rvConfig::DefaultSection(const char* name)
{
    m_strDefaultSection = cfgStr(name);
}

const char* rvConfig::DefaultSection()
{
    return m_strDefaultSection.c_str();
}

unsigned int rvConfig::IsModified()
{
    return m_bModified;
}

void rvConfig::IsModified(unsigned int flag)
{
    m_bModified = flag;
}

unsigned int rvConfig::IsValid()
{
    return m_nItems;
}

const rvConfig::cfgStr* tessaline::config::PeekValue(rvConfig& config, const NameText& key, const NameText& section)
{
    // Callers look many keys up in one section in a row.
    const NameText& name = section.empty() ? NameText(config.m_strSection) : section;
    const rvConfig::SectionTable::iterator found = name.InRecent(config.m_sections);
    if (found == config.m_sections.end()) {
        return nullptr;
    }
    const rvConfig::KeyTable::iterator entry = key.In(found->second);
    return entry == found->second.end() ? nullptr : &entry->second;
}

unsigned int tessaline::config::FindValue(rvConfig& config, const NameText& key, rvConfig::cfgStr* value,
                                          const NameText& section)
{
    ScopedClassLock lock;
    const rvConfig::cfgStr* found = PeekValue(config, key, section);
    if (found == nullptr) {
        return 0;
    }
    *value = *found;
    return 1;
}

// The by-value parameters are the interface's fixed signature.
// NOLINTNEXTLINE(performance-unnecessary-value-param)
unsigned int rvConfig::_GetValue(cfgStr key, cfgStr* value, cfgStr section)
{
    return tessaline::config::FindValue(*this, NameText(key), value, NameText(section));
}

// NOLINTNEXTLINE(performance-unnecessary-value-param)
unsigned int rvConfig::_PutValue(cfgStr key, cfgStr value, cfgStr section)
{
    ScopedClassLock lock;
    const cfgStr& name = section.empty() ? m_strSection : section;
    SectionTable::iterator found = m_sections.find(name);
    if (found == m_sections.end()) {
        found = m_sections.insert(SectionTable::value_type(name, KeyTable())).first;
    }
    // operator[] grows the table for one more entry even when it replaces.
    found->second[key] = std::move(value);
    ++m_nItems;
    IsModified(1);
    return 1;
}

const char* rvConfig::GetValue(const char* key, const char* def, const char* section)
{
    cfgStr value;
    if (tessaline::config::FindValue(*this, NameText(key), &value, NameText(section)) == 0) {
        return def;
    }
    m_strValue = std::move(value);
    return m_strValue.c_str();
}

unsigned int rvConfig::PutValue(const char* key, const char* value, const char* section)
{
    return _PutValue(cfgStr(key), cfgStr(value), cfgStr(section));
}

unsigned int rvConfig::CreateBackups()
{
    return m_bBackups;
}

void rvConfig::CreateBackups(unsigned int flag)
{
    m_bBackups = flag;
}

void rvConfig::Lock()
{
    m_mutex.Lock(nullptr);
}

void rvConfig::Unlock()
{
    m_mutex.Unlock(nullptr);
}
