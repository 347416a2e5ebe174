// The durable replacement of a configuration file: the new text goes to a
// temporary file beside the old one, reaches the disk, and only then takes
// the old file's place, so that a crash at any moment leaves a whole file
// under the configuration's name. rvConfig::Flush documents what each
// failure leaves behind.
#ifndef TESSALINE_SRC_CONFIG_REPLACEMENT_H
#define TESSALINE_SRC_CONFIG_REPLACEMENT_H

#include <cstddef>
#include <cstdio>
#include <string>

namespace tessaline::config {

class Replacement {
public:
    // For the file `configName`, which need not exist yet. Where the name is
    // a symbolic link, or a chain of them, the file replaced is the one at
    // the end of the chain, with the side files beside it; the links stay.
    explicit Replacement(const char* configName);
    // A temporary file that was not committed is closed and removed: the
    // old file stands as it was.
    ~Replacement();
    Replacement(const Replacement&) = delete;
    Replacement& operator=(const Replacement&) = delete;

    // Creates the temporary file afresh, three attempts one second apart,
    // with the mode, owner and group of the file it will replace where the
    // process may give them; false, without a message, when all fail. False
    // at once, with nothing touched, when the chain of links cannot be
    // followed to its end or the names of the file and its side files do not
    // fit the path limit.
    bool Create();

    // Appends to the temporary file. After the first failed write the rest
    // are skipped, and Commit will not use the file.
    void Write(const char* text, std::size_t length);

    // Completes the temporary file and puts it in the old file's place; 1
    // when the file was replaced as asked. An incomplete temporary file is
    // removed and the old file left as it was.
    unsigned int Commit();

private:
    // The file at the end of any links, and the names beside it.
    std::string m_configName;
    std::string m_tempName;
    std::string m_backupName;
    bool m_named;
    FILE* m_file;
    bool m_good;
};

}  // namespace tessaline::config

#endif
