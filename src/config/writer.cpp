// Saving: Flush and the writing pass, which merges the tables into the old
// file's lines and replaces the file by renaming.
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <ctime>
#include <string>

#include "config/borrowed_name.h"
#include "config/class_lock.h"
#include "config/passes.h"
#include "config/side_name.h"
#include "config/sys.h"
#include "tessaline/config/rvConfig.h"
#include "tessaline/util/rvString.h"
#include "util/error_text.h"
#include "util/sys.h"

using tessaline::config::ScopedClassLock;
namespace sys = tessaline::config::sys;

namespace {

constexpr int kCreateAttempts = 3;
constexpr std::size_t kTimeBufferSize = 128;
constexpr unsigned int kFreshFileMode = 0666;
constexpr unsigned int kOwnerOnly = 0600;

// The temporary file. Every write is checked; after the first failure the
// rest are skipped and the file is not used.
class TempFile {
public:
    explicit TempFile(std::string name) : m_name(std::move(name)), m_file(nullptr), m_good(true) {}

    ~TempFile()
    {
        if (m_file != nullptr) {
            std::fclose(m_file);
        }
    }

    TempFile(const TempFile&) = delete;
    TempFile& operator=(const TempFile&) = delete;

    // Creates the file afresh, never through a link planted at its name.
    // It takes the permission bits of the file it will replace, so that a
    // file kept from other users stays so; it is created owner-only until
    // they are set. Without a file to replace it gets those of a new fopen.
    bool Create(const char* configName)
    {
        unsigned int bits = 0;
        const bool replacing = sys::PermissionBits(configName, &bits);
        for (int attempt = 1; attempt <= kCreateAttempts; ++attempt) {
            m_file = sys::CreateStream(m_name.c_str(), replacing ? kOwnerOnly : kFreshFileMode);
            if (m_file != nullptr) {
                if (replacing) {
                    sys::SetPermissionBits(m_file, bits);
                }
                return true;
            }
            tessaline::util::PauseOneSecond();
        }
        return false;
    }

    void Put(const char* text) { Put(text, std::strlen(text)); }

    void Put(const char* text, std::size_t length)
    {
        m_good = m_good && sys::Write(m_file, text, length, m_name.c_str());
    }

    // One write per key line, through a buffer that keeps its capacity.
    void PutKey(const char* key, const char* value)
    {
        m_line.assign(key).append(" = ").append(value).append("\n");
        Put(m_line.data(), m_line.size());
    }

    // Flushes, syncs and closes; true when everything reached the disk.
    bool Finish()
    {
        FILE* file = m_file;
        m_file = nullptr;
        m_good = sys::CloseSynced(file, m_name.c_str()) && m_good;
        return m_good;
    }

    const char* Name() const { return m_name.c_str(); }

private:
    std::string m_name;
    FILE* m_file;
    bool m_good;
    std::string m_line;
};

// Restores the section table when the writing pass is over, however it
// ends: the pass consumes the table it works on.
class TableRestorer {
public:
    explicit TableRestorer(rvConfig::SectionTable& table) : m_table(table), m_saved(table) {}
    ~TableRestorer() { m_table.swap(m_saved); }
    TableRestorer(const TableRestorer&) = delete;
    TableRestorer& operator=(const TableRestorer&) = delete;

private:
    rvConfig::SectionTable& m_table;
    rvConfig::SectionTable m_saved;
};

// Writes the keys that the running section still holds, in table order,
// and takes the section out of the table.
void drain(rvConfig& config, TempFile& out, const rvConfig::cfgStr& running)
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

unsigned int sectionKeyCount(rvConfig& config, const rvConfig::cfgStr& name)
{
    const rvConfig::SectionTable::iterator section = config.m_sections.find(name);
    return section == config.m_sections.end() ? 0 : static_cast<unsigned int>(section->second.size());
}

// A key line of the old file: written where it stands with the table's
// value, or dropped when the table no longer holds the key.
void mergeKeyLine(rvConfig& config, TempFile& out, char* text, const rvConfig::cfgStr& running)
{
    char* rest;
    const char* key = tessaline::config::KeyOfLine(config, text, &rest);
    if (*key == '\0') {
        return;
    }
    // "" in GetValue is the current section. Below a nameless section line
    // whose section is gone, that is another section, whose keys must not be
    // pulled up here: the file would give them back in the wrong section.
    if (running.empty() && config.m_sections.find(running) == config.m_sections.end()) {
        return;
    }
    const char* value = config.GetValue(key, static_cast<const char*>(nullptr), running.c_str());
    if (value == nullptr) {
        return;
    }
    out.PutKey(key, value);
    // Erase from the section the lookup searched: "" is the current one.
    const rvConfig::cfgStr& name = running.empty() ? config.m_strSection : running;
    const rvConfig::SectionTable::iterator section = config.m_sections.find(name);
    if (section == config.m_sections.end()) {
        return;
    }
    section->second.erase(tessaline::config::BorrowedName(key));
    if (section->second.empty()) {
        // A copy: removing the current section may replace m_strSection.
        const rvConfig::cfgStr emptied = name;
        config.RemoveSection(emptied.c_str());
    }
}

// Copies the old file's comments and blank lines, writes its keys with the
// table's values, and drains each section at the next section line.
void mergeOldLines(rvConfig& config, TempFile& out, rvConfig::cfgStr& running)
{
    const std::size_t idLength = std::strlen(rvConfig::m_szIdString);
    char line[tessaline::config::kLineBufferSize];
    while (config.m_pFile != nullptr && !std::feof(config.m_pFile)) {
        if (!tessaline::config::ReadLine(config.m_pFile, line)) {
            break;
        }
        char* text = config.Clean(line);
        if (*text == '\0') {
            out.Put(line);
        } else if (tessaline::config::IsCommentLine(text)) {
            if (_strnicmp(text, rvConfig::m_szIdString, static_cast<unsigned>(idLength)) != 0) {
                out.Put(line);
                out.Put("\n");
            }
        } else if (tessaline::config::IsSectionLine(text)) {
            const char* name = tessaline::config::SectionName(config, text);
            if (_stricmp(name, running.c_str()) != 0) {
                drain(config, out, running);
            }
            running = rvConfig::cfgStr(name);
            if (config.Section(name, 0) != 0 && sectionKeyCount(config, running) != 0) {
                out.Put("[");
                out.Put(name);
                out.Put("]\n");
            }
        } else {
            mergeKeyLine(config, out, text, running);
        }
    }
}

void writeNewSections(rvConfig& config, TempFile& out)
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

void writeIdentificationLine(TempFile& out)
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

void reportUnlinkFailure(const char* name)
{
    const int error = errno;
    std::fprintf(stderr, "rvConfig: unlink(%s) failed: %s (%d).", name, tessaline::util::ErrorText(error), error);
}

// Replaces an existing file so that its name never stands empty: the old
// file gets its backup name as a second link, and the temporary file is
// renamed over it. False, with nothing changed but an earlier backup gone,
// where a step is refused (a file system without hard links, say).
bool replaceInOneStep(const char* configName, const char* tempName, const std::string& backupName)
{
    if (rvConfig::m_bBackups == 0) {
        return sys::Replace(tempName, configName) == 0;
    }
    sys::Unlink(backupName.c_str());
    if (sys::Link(configName, backupName.c_str()) != 0) {
        return false;
    }
    if (sys::Replace(tempName, configName) != 0) {
        sys::Unlink(backupName.c_str());
        return false;
    }
    return true;
}

// Moves the old file aside (or removes it) and renames the temporary file
// into its place, step by step, with a message for each failure. 1 when
// the file was replaced as asked.
unsigned int replaceInSteps(const char* configName, const char* tempName, const std::string& backupName,
                            bool oldFileExists)
{
    unsigned int result = 1;
    if (oldFileExists) {
        if (rvConfig::m_bBackups != 0) {
            sys::Unlink(backupName.c_str());
            if (sys::Rename(configName, backupName.c_str()) != 0) {
                std::fprintf(stderr, "Error creating backup config file %s: %s\n", configName, tessaline::util::ErrorText(errno));
                result = 0;
            }
        } else if (sys::Unlink(configName) != 0) {
            reportUnlinkFailure(configName);
        }
    }
    if (sys::Rename(tempName, configName) != 0) {
        const int error = errno;
        std::fprintf(stderr, "rvConfig: rename(%s, %s) failed: %s (%d).", tempName, configName, tessaline::util::ErrorText(error),
                     error);
        // Without backups the old file is gone and the temporary file holds
        // the only copy on disk: it stays.
        if (rvConfig::m_bBackups != 0 && sys::Unlink(tempName) != 0) {
            reportUnlinkFailure(tempName);
        }
        return 0;
    }
    return result;
}

// The one-step replacement where the file system allows it; else the
// steps, which then give every message and result as if they had been
// the only way.
unsigned int replaceFile(const char* configName, const char* tempName)
{
    const std::string backupName = tessaline::config::SideFileName(configName, "bak");
    const bool oldFileExists = sys::Exists(configName);
    const unsigned int result = oldFileExists && replaceInOneStep(configName, tempName, backupName)
                                    ? 1
                                    : replaceInSteps(configName, tempName, backupName, oldFileExists);
    sys::SyncDirectory(configName);
    return result;
}

}  // namespace

unsigned int tessaline::config::WritePass(rvConfig& config)
{
    rvConfig::cfgStr running(config.m_strDefaultSection);
    TempFile out(SideFileName(config.m_szConfigName, "new"));
    if (!out.Create(config.m_szConfigName)) {
        return 0;
    }
    if (config.m_pFile != nullptr) {
        mergeOldLines(config, out, running);
    }
    config.Close(0);
    drain(config, out, running);
    writeNewSections(config, out);
    writeIdentificationLine(out);
    if (!out.Finish()) {
        sys::Unlink(out.Name());
        return 0;
    }
    sys::SyncDirectory(out.Name());
    return replaceFile(config.m_szConfigName, out.Name());
}

// The class lock covers the whole of Flush, not the writing pass alone:
// two threads that flush one shared object would otherwise race on its
// stream, and a store made between the pass and the clearing of the
// modified flag would be marked as saved without being on disk.
unsigned int rvConfig::Flush(unsigned int bClear)
{
    ScopedClassLock lock;
    if (IsModified() != 0) {
        if (m_mode == OpenRead || m_szConfigName[0] == '\0') {
            return 0;
        }
        if (sys::Exists(m_szConfigName)) {
            if (!sys::Writable(m_szConfigName) || Open(m_szConfigName, m_mode) == nullptr) {
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
