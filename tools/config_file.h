// One configuration file as the tool works on it: read through the library
// as a host reads it, changed in memory, and written back with one Flush
// only when something changed, so that a command that changes nothing
// leaves the file untouched.
//
// Sections are named as on the command line: "" is the default section,
// the keys above the first section line. A section line with nothing
// between its brackets names a section that the tool cannot address; it is
// left out of every listing.
#ifndef TESSALINE_TOOLS_CONFIG_FILE_H
#define TESSALINE_TOOLS_CONFIG_FILE_H

#include <tessaline/config/rvConfig.h>

#include <cstdio>
#include <string>
#include <vector>

namespace tessaline::tools {

class ConfigFile {
public:
    enum class Missing { kFails, kReadsEmpty };

    // Reads `path`. A missing file throws Failure(kFileError) at once with
    // kFails and reads as empty with kReadsEmpty (Save creates it, if
    // anything was stored). A file that exists but is not a readable
    // regular file, or a name the library would cut, throws
    // Failure(kFileError) without waiting for the library's retries.
    ConfigFile(const std::string& path, Missing missing);

    // Reads `stream` to its end and closes it; `name` stands for it in
    // messages. Such a file is never saved.
    ConfigFile(std::FILE* stream, const std::string& name);

    ConfigFile(const ConfigFile&) = delete;
    ConfigFile& operator=(const ConfigFile&) = delete;

    const std::string& Name() const { return m_name; }

    // Whether the section is there: the default section always is, another
    // one when a section line or a key made it, keys or not.
    bool HasSection(const std::string& section);
    // Whether removing the section would change the file.
    bool SectionHasContent(const std::string& section);

    // The value, or null when the key or the section is missing. Valid
    // until the next call of Find.
    const char* Find(const std::string& section, const std::string& key);

    // Throws Failure(kUsage) for a line the reader would cut (see
    // CheckLineLength).
    void Store(const std::string& section, const std::string& key, const std::string& value);
    void RemoveKey(const std::string& section, const std::string& key);
    void RemoveSection(const std::string& section);

    // Section names in the library's enumeration order; the default section
    // only when it holds keys.
    std::vector<std::string> Sections();
    // The section's keys in table order, with their values.
    std::vector<std::pair<std::string, std::string>> Entries(const std::string& section);

    // Writes the file if anything was stored or removed (creating it if it
    // was missing), keeping the old file as the backup when `backup` is set.
    // Every value that the reader would not give back as it is, stored now
    // or read in quotes, is written in quotes (see Carried).
    // With `verbose`, reports "changed" or "unchanged" on stderr. Throws
    // Failure(kFileError) when the file cannot be written; the old file then
    // stays as it was.
    void Save(bool backup, bool verbose);

private:
    // The library's name of a section given on the command line.
    std::string LibraryName(const std::string& section);

    std::string m_name;
    rvConfig m_config;
};

}  // namespace tessaline::tools

#endif
