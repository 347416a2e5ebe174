// Saving: Flush and the writing pass, which merges the tables into the old
// file's lines and hands the result to the durable replacement.
#include <algorithm>
#include <cstdio>
#include <cstring>
#include <ctime>
#include <memory>
#include <optional>
#include <string>

#include <unistd.h>

#include "config/class_lock.h"
#include "config/config_name.h"
#include "config/lookup.h"
#include "config/passes.h"
#include "config/replacement.h"
#include "config/sys.h"
#include "tessaline/config/rvConfig.h"
#include "tessaline/util/rvString.h"
#include "util/thread_annotations.h"

namespace tessaline::config {

namespace {

constexpr std::size_t kTimeBufferSize = 128;

// The merged text on its way into the temporary file, gathered in a buffer
// and written in large pieces.
class Output {
public:
    explicit Output(Replacement& file) : m_file(file) {}

    void Put(const char* text) { Put(text, std::strlen(text)); }

    void Put(const char* text, std::size_t length)
    {
        if (m_used + length > kBufferSize) {
            Drain();
            if (length > kBufferSize) {
                m_file.Write(text, length);
                return;
            }
        }
        std::memcpy(m_buffer.get() + m_used, text, length);
        m_used += length;
    }

    void PutKey(const char* key, const char* value)
    {
        const std::size_t keyLength = std::strlen(key);
        const std::size_t valueLength = std::strlen(value);
        if (m_used + keyLength + valueLength + 4 > kBufferSize) {
            Put(key, keyLength);
            Put(" = ", 3);
            Put(value, valueLength);
            Put("\n", 1);
            return;
        }
        char* line = m_buffer.get() + m_used;
        // A line, not a string: no NUL follows it in the buffer.
        std::copy_n(key, keyLength, line);
        std::copy_n(" = ", 3, line + keyLength);
        std::copy_n(value, valueLength, line + keyLength + 3);
        line[keyLength + valueLength + 3] = '\n';
        m_used += keyLength + valueLength + 4;
    }

    // Hands what is gathered to the file.
    void Drain()
    {
        if (m_used != 0) {
            m_file.Write(m_buffer.get(), m_used);
            m_used = 0;
        }
    }

private:
    static constexpr std::size_t kBufferSize = 65536;

    Replacement& m_file;
    std::unique_ptr<char[]> m_buffer{new char[kBufferSize]};
    std::size_t m_used = 0;
};

// Restores the section table when the writing pass is over, however it
// ends: the pass consumes the table it works on. It works on a copy that
// borrows the entries of the saved table, so that neither the copy nor the
// consumption touches a text; the table given back is the one taken.
class TableRestorer {
public:
    explicit TableRestorer(rvConfig::SectionTable& table) : m_table(table), m_saved(std::move(table))
    {
        try {
            m_table = rvConfig::SectionTable(m_saved, BorrowingCopy());
        } catch (...) {
            m_table.swap(m_saved);
            throw;
        }
    }
    ~TableRestorer() { m_table.swap(m_saved); }
    TableRestorer(const TableRestorer&) = delete;
    TableRestorer& operator=(const TableRestorer&) = delete;

private:
    rvConfig::SectionTable& m_table;
    rvConfig::SectionTable m_saved;
};

// Writes the keys that the running section still holds, in table order,
// and takes the section out of the table.
void Drain(rvConfig& config, Output& out, const rvConfig::cfgStr& running) TESSALINE_REQUIRES(g_classLock)
{
    const rvConfig::SectionTable::iterator section = config.m_sections.find(running);
    if (section != config.m_sections.end()) {
        rvConfig::KeyTable& keys = section->second;
        rvConfig::KeyTable::iterator key = keys.begin();
        while (key != keys.end()) {
            out.PutKey(key->first.c_str(), key->second.c_str());
            const rvConfig::KeyTable::iterator written = key;
            ++key;
            keys.erase(written);
        }
    }
    config.RemoveSection(running.c_str());
}

unsigned int SectionKeyCount(rvConfig& config, const rvConfig::cfgStr& name) TESSALINE_REQUIRES(g_classLock)
{
    const rvConfig::SectionTable::iterator section = config.m_sections.find(name);
    return section == config.m_sections.end() ? 0 : static_cast<unsigned int>(section->second.size());
}

// A key line of the old file: written where it stands with the table's
// value, or dropped when the table no longer holds the key.
// `lastValue` borrows the last value written, which GetValue would have left
// in m_strValue.
void MergeKeyLine(rvConfig& config, Output& out, char* text, const rvConfig::cfgStr& running,
                  std::optional<rvConfig::cfgStr>& lastValue) TESSALINE_REQUIRES(g_classLock)
{
    char* rest;
    const char* key = KeyOfLine(config, text, &rest);
    if (*key == '\0') {
        return;
    }
    // "" in a lookup is the current section. Below a nameless section line
    // whose section is gone, that is another section, whose keys must not be
    // pulled up here: the file would give them back in the wrong section.
    if (running.empty() && config.m_sections.find(running) == config.m_sections.end()) {
        return;
    }
    // Borrowed, not counted: the saved table holds every text while the
    // pass runs.
    const rvConfig::cfgStr* value = PeekValue(config, NameText(key), NameText(running));
    if (value == nullptr) {
        return;
    }
    out.PutKey(key, value->c_str());
    lastValue.emplace(*value, BorrowingCopy());
    // Erase from the section the lookup searched: "" is the current one.
    // The lookup has just found both names, so neither is hashed again.
    const rvConfig::cfgStr& name = running.empty() ? config.m_strSection : running;
    const rvConfig::SectionTable::iterator section = NameText(name).InRecent(config.m_sections);
    if (section == config.m_sections.end()) {
        return;
    }
    rvConfig::KeyTable& keys = section->second;
    const rvConfig::KeyTable::iterator entry = NameText(key).InRecent(keys);
    if (entry != keys.end()) {
        keys.erase(entry);
    }
    if (keys.empty()) {
        // A copy: removing the current section may replace m_strSection.
        const rvConfig::cfgStr emptied = name;
        config.RemoveSection(emptied.c_str());
    }
}

// Copies the old file's comments and blank lines, writes its keys with the
// table's values, and drains each section at the next section line. False
// when a read error cut the old file short.
bool MergeOldLines(rvConfig& config, Output& out, rvConfig::cfgStr& running) TESSALINE_REQUIRES(g_classLock)
{
    const std::size_t idLength = std::strlen(rvConfig::m_szIdString);
    char line[kLineBufferSize];
    std::optional<rvConfig::cfgStr> lastValue;
    bool more = ReadLine(config.m_pFile, line);
    if (SkipByteOrderMark(line)) {
        out.Put(kByteOrderMark);
    }
    for (; more; more = ReadLine(config.m_pFile, line)) {
        char* text = config.Clean(line);
        if (*text == '\0') {
            out.Put(line);
        } else if (IsCommentLine(text)) {
            if (_strnicmp(text, rvConfig::m_szIdString, static_cast<unsigned>(idLength)) != 0) {
                out.Put(line);
                out.Put("\n");
            }
        } else if (IsSectionLine(text)) {
            const char* name = SectionName(config, text);
            if (_stricmp(name, running.c_str()) != 0) {
                Drain(config, out, running);
            }
            running = rvConfig::cfgStr(name);
            if (config.Section(name, 0) != 0 && SectionKeyCount(config, running) != 0) {
                out.Put("[");
                out.Put(name);
                out.Put("]\n");
            }
        } else {
            MergeKeyLine(config, out, text, running, lastValue);
        }
    }
    if (lastValue) {
        config.m_strValue = *lastValue;
    }
    return !ReadFailed(config.m_pFile);
}

void WriteNewSections(rvConfig& config, Output& out) TESSALINE_REQUIRES(g_classLock)
{
    for (rvConfig::SectionTable::iterator section = config.m_sections.begin(); section != config.m_sections.end();
         ++section) {
        if (section->first.empty() || section->second.empty()) {
            continue;
        }
        out.Put("[");
        out.Put(section->first.c_str());
        out.Put("]\n");
        config.m_strSection = section->first;
        for (rvConfig::KeyTable::iterator key = section->second.begin(); key != section->second.end(); ++key) {
            out.PutKey(key->first.c_str(), key->second.c_str());
        }
    }
}

void WriteIdentificationLine(Output& out)
{
    const std::time_t now = std::time(nullptr);
    std::tm local;
    char stamp[kTimeBufferSize];
    if (localtime_r(&now, &local) == nullptr ||
        std::strftime(stamp, sizeof stamp, ": %B %d, %Y - %H:%M:%S\n", &local) == 0) {
        std::strcpy(stamp, "\n");
    }
    out.Put(rvConfig::m_szIdString);
    out.Put(stamp);
}

}  // namespace

unsigned int WritePass(rvConfig& config)
{
    rvConfig::cfgStr running(config.m_strDefaultSection);
    Replacement file(config.m_szConfigName);
    if (!file.Create()) {
        return 0;
    }
    Output out(file);
    // The rest of a file cut short by a read error would be lost with its
    // comments and layout: the old file stays instead.
    const bool whole = MergeOldLines(config, out, running);
    config.Close(0);
    if (!whole) {
        return 0;
    }
    Drain(config, out, running);
    WriteNewSections(config, out);
    WriteIdentificationLine(out);
    out.Drain();
    return file.Commit();
}

}  // namespace tessaline::config

using tessaline::config::kMaxConfigName;
using tessaline::config::ScopedClassLock;
using tessaline::config::Sys;
using tessaline::config::TableRestorer;

// The class lock covers the whole of Flush, not the writing pass alone:
// two threads that flush one shared object would otherwise race on its
// stream, and a store made between the pass and the clearing of the
// modified flag would be marked as saved without being on disk.
unsigned int rvConfig::Flush(unsigned int bClear)
{
    ScopedClassLock lock;
    if (IsModified() != 0) {
        // Every name longer than the limit was cut to it, and a cut name is
        // another file.
        const std::size_t nameLength = strnlen(m_szConfigName, kMaxConfigName);
        if (m_mode == OpenRead || nameLength == 0 || nameLength == kMaxConfigName) {
            return 0;
        }
        if (Sys().access(m_szConfigName, F_OK) == 0) {
            if (Sys().access(m_szConfigName, W_OK) != 0 || Open(m_szConfigName, m_mode) == nullptr) {
                return 0;
            }
        }
        unsigned int written;
        {
            TableRestorer restorer(m_sections);
            written = Serialize(1);
        }
        if (written == 0) {
            return 0;
        }
        IsModified(0);
    }
    if (bClear != 0) {
        Clear();
    }
    return 1;
}
