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
    // For the file `configName`, which need not exist yet.
    explicit Replacement(const char* configName);
    // A temporary file that was not committed is closed and removed: the
    // old file stands as it was.
    ~Replacement();
    Replacement(const Replacement&) = delete;
    Replacement& operator=(const Replacement&) = delete;

    // Creates the temporary file afresh, three attempts one second apart;
    // false, without a message, when all fail.
    bool Create();

    // Appends to the temporary file. After the first failed write the rest
    // are skipped, and Commit will not use the file.
    void Write(const char* text, std::size_t length);

    // Completes the temporary file and puts it in the old file's place; 1
    // when the file was replaced as asked. An incomplete temporary file is
    // removed and the old file left as it was.
    unsigned int Commit();

private:
    std::string m_configName;
    std::string m_tempName;
    FILE* m_file;
    bool m_good;
};

}  // namespace tessaline::config

#endif
