// Opening a configuration file and the reading pass.
#include <cerrno>
#include <cstring>
#include <ctime>
#include <functional>
#include <string_view>

#include <stdio_ext.h>

#include "config/class_lock.h"
#include "config/passes.h"
#include "config/sys.h"
#include "tessaline/config/rvConfig.h"
#include "util/sys.h"

namespace tessaline::config {

namespace {

constexpr int kOpenAttempts = 3;

// The trim set " \t\n\r", tested without a call: Clean runs on every line.
bool IsTrimmed(char c)
{
    return c == ' ' || c == '\t' || c == '\n' || c == '\r';
}

FILE* OpenByMode(const char* name, rvConfig::OpenMode mode)
{
    switch (mode) {
    case rvConfig::OpenRead:
        return Sys().fopen(name, "re");
    case rvConfig::OpenWrite:
        return Sys().fopen(name, "we");
    case rvConfig::OpenUpdate: {
        FILE* stream = Sys().fopen(name, "r+e");
        return stream != nullptr ? stream : Sys().fopen(name, "w+e");
    }
    }
    return nullptr;
}

}  // namespace

bool IsCommentLine(const char* text)
{
    return *text != '\0' && std::strchr(rvConfig::m_szCommentChars, *text) != nullptr;
}

bool IsSectionLine(const char* text)
{
    return *text != '\0' && std::strchr(rvConfig::m_szSectionChars, *text) != nullptr;
}

char* SectionName(rvConfig& config, char* text)
{
    char* start = text + std::strspn(text, rvConfig::m_szSectionChars);
    start[std::strcspn(start, rvConfig::m_szSectionChars)] = '\0';
    return config.Clean(start);
}

char* KeyOfLine(rvConfig& config, char* text, char** rest)
{
    char* start = text + std::strspn(text, rvConfig::m_szDelimChars);
    char* delimiter = start + std::strcspn(start, rvConfig::m_szDelimChars);
    *rest = nullptr;
    if (*delimiter != '\0') {
        *delimiter = '\0';
        *rest = delimiter + 1;
    }
    return config.Clean(start);
}

bool ReadLine(FILE* stream, char* line)
{
    // Every use of the line is a C string, so only its first byte needs
    // clearing, not the whole buffer.
    line[0] = '\0';
    return stream != nullptr && Sys().fgets(line, kLineLimit, stream) != nullptr;
}

// The mark counts toward the 4094 bytes of the first piece.
bool SkipByteOrderMark(char* line)
{
    const std::string_view mark(kByteOrderMark);
    const std::string_view text(line);
    if (text.substr(0, mark.size()) != mark) {
        return false;
    }
    std::memmove(line, line + mark.size(), text.size() - mark.size() + 1);
    return true;
}

bool ReadFailed(FILE* stream)
{
    return stream != nullptr && __freadable(stream) != 0 && Sys().ferror(stream) != 0;
}

namespace {

// The value behind the delimiter: trimmed, then one opening quote removed
// and the text cut at the last closing one. Null when nothing is stored.
char* ValueOfLine(rvConfig& config, char* rest)
{
    char* value = config.Clean(rest);
    if (*value == '\0') {
        return nullptr;
    }
    if (*value == '"') {
        ++value;
        char* closing = std::strrchr(value, '"');
        if (closing != nullptr) {
            *closing = '\0';
        }
    }
    return value;
}

// The key names of one reading pass. Most files repeat their key names from
// section to section, so the pass shares one text per spelling instead of
// copying it for every line: the text is immutable and shared anyway. A
// small direct-mapped cache bounds the cost for files whose names never
// repeat; a name that is not in it is copied as before.
class KeyNames {
public:
    const rvConfig::cfgStr& Get(const char* text)
    {
        rvConfig::cfgStr& slot = m_slots[std::hash<std::string_view>{}(text) % kSlots];
        if (slot.empty() || std::strcmp(slot.c_str(), text) != 0) {
            slot = rvConfig::cfgStr(text);
        }
        return slot;
    }

private:
    static constexpr size_t kSlots = 256;
    rvConfig::cfgStr m_slots[kSlots];
};

rvConfig::KeyTable& SectionKeys(rvConfig& config, const rvConfig::cfgStr& name) TESSALINE_REQUIRES(g_classLock)
{
    rvConfig::SectionTable::iterator found = config.m_sections.find(name);
    if (found == config.m_sections.end()) {
        found = config.m_sections.insert(rvConfig::SectionTable::value_type(name, rvConfig::KeyTable())).first;
    }
    return found->second;
}

}  // namespace

void ReadPass(rvConfig& config)
{
    rvConfig::cfgStr running(config.m_strDefaultSection);
    config.Clear();
    config.m_strSection = config.m_strDefaultSection;
    SectionKeys(config, config.m_strSection).clear();

    // Only section lines and Section can change the section table between
    // key lines, so the running section is looked up once per block.
    rvConfig::KeyTable* keys = nullptr;
    KeyNames keyNames;
    char line[kLineBufferSize];
    bool more = ReadLine(config.m_pFile, line);
    SkipByteOrderMark(line);
    for (; more; more = ReadLine(config.m_pFile, line)) {
        char* text = config.Clean(line);
        if (*text == '\0' || IsCommentLine(text)) {
            continue;
        }
        if (IsSectionLine(text)) {
            const char* name = SectionName(config, text);
            running = rvConfig::cfgStr(name);
            keys = nullptr;
            config.Section(name, 1);
            continue;
        }
        char* rest;
        const char* key = KeyOfLine(config, text, &rest);
        if (*key == '\0' || rest == nullptr) {
            continue;
        }
        const char* value = ValueOfLine(config, rest);
        if (value == nullptr) {
            continue;
        }
        if (keys == nullptr) {
            keys = &SectionKeys(config, running);
        }
        keys->try_emplace(keyNames.Get(key), value);
        ++config.m_nItems;
    }
    config.Close(0);
    config.m_strSection = config.m_strDefaultSection;
}

}  // namespace tessaline::config

using tessaline::config::IsTrimmed;
using tessaline::config::kOpenAttempts;
using tessaline::config::OpenByMode;
using tessaline::config::ScopedClassLock;
using tessaline::config::Sys;

FILE* rvConfig::Open(const char* name, OpenMode mode)
{
    if (m_pFile != nullptr) {
        Sys().fclose(m_pFile);
        m_pFile = nullptr;
    }
    if (name == nullptr) {
        return nullptr;
    }
    for (int attempt = 1; (m_pFile = OpenByMode(name, mode)) == nullptr; ++attempt) {
        tessaline::util::PauseOneSecond();
        if (attempt == kOpenAttempts) {
            return nullptr;
        }
    }
    ConfigName(name);
    m_mode = mode;
    return m_pFile;
}

unsigned int rvConfig::Load(const char* name, OpenMode mode)
{
    ScopedClassLock lock;
    if (Open(name, mode) == nullptr) {
        return 0;
    }
    Serialize(0);
    Close(0);
    ConfigName(name);
    return 1;
}

unsigned int rvConfig::Close(unsigned int bFlush)
{
    if (m_pFile != nullptr) {
        Sys().fclose(m_pFile);
        m_pFile = nullptr;
    }
    if (bFlush != 0 && IsModified() != 0) {
        Flush(0);
    }
    return 1;
}

// Load and Flush hold the class lock already; a caller that runs a pass on
// a stream of its own Open gets the same protection.
unsigned int rvConfig::Serialize(unsigned int bWrite)
{
    ScopedClassLock lock;
    if (bWrite != 0) {
        return tessaline::config::WritePass(*this);
    }
    tessaline::config::ReadPass(*this);
    return 0;
}

char* rvConfig::Clean(char* text)
{
    if (text == nullptr || *text == '\0') {
        return text;
    }
    char* start = text;
    while (IsTrimmed(*start)) {
        ++start;
    }
    // One pass to the end, remembering where the kept text stops: lines are
    // short, and a call to strlen would cost more than the loop.
    char* kept = start;
    char* end = start;
    for (; *end != '\0'; ++end) {
        if (!IsTrimmed(*end)) {
            kept = end + 1;
        }
    }
    if (kept != start) {
        std::memset(kept, '\0', static_cast<std::size_t>(end - kept));
    }
    return start;
}
