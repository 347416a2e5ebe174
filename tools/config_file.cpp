#include "config_file.h"

#include <fcntl.h>
#include <strings.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <climits>
#include <cstdlib>

#include "failure.h"
#include "text.h"

namespace tessaline::tools {

namespace {

// The library keeps at most this many characters of a file name; a longer
// name would make it read and write another file.
constexpr std::size_t kLongestName = sizeof(rvConfig::m_szConfigName) - 2;

Failure FileError(const std::string& name, const std::string& what)
{
    return Failure{kFileError, name + ": " + what};
}

// Whether `path` names a readable regular file; false when nothing is
// there. The library would retry a failing open for three seconds and read
// a directory as an empty file, so both are ruled out here first. Opening
// without blocking keeps a FIFO from hanging the tool.
bool ReadableFileExists(const std::string& path)
{
    if (path.empty()) {
        throw FileError("''", SystemText(ENOENT));
    }
    if (path.size() > kLongestName) {
        throw FileError(path, SystemText(ENAMETOOLONG));
    }
    int descriptor = open(path.c_str(), O_RDONLY | O_NONBLOCK | O_NOCTTY | O_CLOEXEC);
    if (descriptor < 0) {
        int error = errno;
        if (error == ENOENT) {
            return false;
        }
        throw FileError(path, SystemText(error));
    }
    struct stat info {};
    int result = fstat(descriptor, &info);
    int error = errno;
    close(descriptor);
    if (result != 0) {
        throw FileError(path, SystemText(error));
    }
    if (S_ISDIR(info.st_mode)) {
        throw FileError(path, SystemText(EISDIR));
    }
    if (!S_ISREG(info.st_mode)) {
        throw FileError(path, "not a regular file");
    }
    return true;
}

std::string DirectoryOf(const std::string& path)
{
    std::string::size_type slash = path.rfind('/');
    if (slash == std::string::npos) {
        return ".";
    }
    return slash == 0 ? "/" : path.substr(0, slash);
}

// The file `path` names through any symbolic links; `path` itself when there
// is none yet (a missing file, a dangling link: the library then finds the
// link's final target on its own).
std::string FinalName(const std::string& path)
{
    char resolved[PATH_MAX];
    return realpath(path.c_str(), resolved) != nullptr ? std::string(resolved) : path;
}

}  // namespace

ConfigFile::ConfigFile(const std::string& path, Missing missing) : m_name(path)
{
    if (!ReadableFileExists(path)) {
        if (missing == Missing::kFails) {
            throw FileError(path, SystemText(ENOENT));
        }
        m_config.ConfigName(path.c_str());
    } else if (m_config.Load(path.c_str(), rvConfig::OpenRead) == 0) {
        throw FileError(path, SystemText(errno));
    }
    // Read as a host reads; written back merging into the old text.
    m_config.Mode(rvConfig::OpenUpdate);
}

ConfigFile::ConfigFile(std::FILE* stream, const std::string& name) : m_name(name)
{
    // The reading pass of Load on a stream Load could not open by name. The
    // tool has one thread, so Load's class lock is not missed.
    m_config.m_pFile = stream;
    m_config.Serialize(0);
}

std::string ConfigFile::LibraryName(const std::string& section)
{
    return section.empty() ? std::string(m_config.DefaultSection()) : section;
}

bool ConfigFile::HasSection(const std::string& section)
{
    return section.empty() || m_config.Section(section.c_str(), 0) != 0;
}

bool ConfigFile::SectionHasContent(const std::string& section)
{
    if (m_config.TokenCnt(LibraryName(section).c_str()) != 0) {
        return true;
    }
    // An empty section still has its header line in the file.
    return !section.empty() && strcasecmp(section.c_str(), m_config.DefaultSection()) != 0 && HasSection(section);
}

const char* ConfigFile::Find(const std::string& section, const std::string& key)
{
    return m_config.GetValue(key.c_str(), static_cast<const char*>(nullptr), LibraryName(section).c_str());
}

void ConfigFile::Store(const std::string& section, const std::string& key, const std::string& value)
{
    CheckLineLength(key, Carried(value));
    m_config.PutValue(key.c_str(), value.c_str(), LibraryName(section).c_str());
}

void ConfigFile::RemoveKey(const std::string& section, const std::string& key)
{
    m_config.RemoveKey(LibraryName(section).c_str(), key.c_str());
}

void ConfigFile::RemoveSection(const std::string& section)
{
    m_config.RemoveSection(LibraryName(section).c_str());
}

std::vector<std::string> ConfigFile::Sections()
{
    std::vector<std::string> sections;
    for (const char* name = m_config.EnumSections(1); name != nullptr; name = m_config.EnumSections(0)) {
        if (strcasecmp(name, m_config.DefaultSection()) == 0) {
            if (m_config.TokenCnt(name) != 0) {
                sections.emplace_back();
            }
        } else if (*name != '\0') {
            sections.emplace_back(name);
        }
    }
    return sections;
}

std::vector<std::pair<std::string, std::string>> ConfigFile::Entries(const std::string& section)
{
    std::string name = LibraryName(section);
    std::vector<std::pair<std::string, std::string>> entries;
    for (const char* key = m_config.EnumTokens(name.c_str(), 1); key != nullptr;
         key = m_config.EnumTokens(name.c_str(), 0)) {
        entries.emplace_back(key, m_config.GetValue(key, "", name.c_str()));
    }
    return entries;
}

void ConfigFile::Save(bool backup, bool verbose)
{
    bool changed = m_config.IsModified() != 0;
    if (changed) {
        // Flush would retry a directory it cannot write to for three seconds.
        // It writes beside the file a symbolic link finally names.
        if (access(DirectoryOf(FinalName(m_name)).c_str(), W_OK | X_OK) != 0) {
            throw FileError(m_name, SystemText(errno));
        }
        // The writer does not quote: without this, a value that came in
        // quotes would lose its blanks or, if empty, its key in the rewrite.
        for (auto& section : m_config.m_sections) {
            for (auto& entry : section.second) {
                std::string carried = Carried(entry.second.c_str());
                if (carried != entry.second.c_str()) {
                    entry.second = rvConfig::cfgStr(carried.c_str());
                }
            }
        }
        m_config.CreateBackups(backup ? 1 : 0);
        errno = 0;
        if (m_config.Flush(0) == 0) {
            int error = errno;
            throw FileError(m_name, "cannot be written" + (error != 0 ? ": " + SystemText(error) : std::string()));
        }
    }
    if (verbose) {
        std::fprintf(stderr, "tessaline-config: %s: %s\n", m_name.c_str(), changed ? "changed" : "unchanged");
    }
}

}  // namespace tessaline::tools
