// Enumeration, counts and removal.
#include "config/class_lock.h"
#include "config/lookup.h"
#include "tessaline/config/rvConfig.h"

using tessaline::config::ScopedClassLock;

const char* rvConfig::EnumSections(unsigned int first)
{
    if (first != 0) {
        m_itSection = m_sections.begin();
    } else if (m_itSection != m_sections.end()) {
        ++m_itSection;
    }
    if (m_itSection == m_sections.end()) {
        return nullptr;
    }
    return m_itSection->first.c_str();
}

const char* rvConfig::EnumTokens(const char* section, unsigned int first)
{
    if (first != 0) {
        m_bTokenStart = 1;
    }
    const SectionTable::iterator found = m_sections.find(section);
    if (found == m_sections.end()) {
        return nullptr;
    }
    KeyTable& keys = found->second;
    if (m_bTokenStart != 0) {
        m_itToken = keys.begin();
        m_bTokenStart = 0;
    } else if (m_itToken != keys.end()) {
        ++m_itToken;
    }
    if (m_itToken == keys.end()) {
        m_bTokenStart = 1;
        return nullptr;
    }
    return m_itToken->first.c_str();
}

unsigned int rvConfig::TokenCnt(const char* section)
{
    const SectionTable::iterator found = tessaline::config::NameText(section).In(m_sections);
    return found == m_sections.end() ? 0 : static_cast<unsigned int>(found->second.size());
}

unsigned int rvConfig::SectionCnt()
{
    return static_cast<unsigned int>(m_sections.size());
}

void rvConfig::RemoveKey(const char* section, const char* key)
{
    ScopedClassLock lock;
    const SectionTable::iterator found = m_sections.find(section);
    if (found != m_sections.end()) {
        found->second.erase(key);
    }
    IsModified(1);
}

void rvConfig::RemoveSection(const char* section)
{
    ScopedClassLock lock;
    m_sections.erase(section);
    IsModified(1);
}
