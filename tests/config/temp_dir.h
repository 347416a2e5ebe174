// A scratch directory for configuration files, with the file helpers the
// configuration tests use.
#ifndef TESSALINE_TESTS_CONFIG_TEMP_DIR_H
#define TESSALINE_TESTS_CONFIG_TEMP_DIR_H

#include <fstream>
#include <iterator>
#include <string>

#include <sys/stat.h>
#include <unistd.h>

#include "support/temp_dir.h"

namespace tessaline::test {

class ConfigDir : public TempDir {
public:
    std::string Path(const std::string& name) const { return *this / name; }
    bool Exists(const std::string& name) const { return access(Path(name).c_str(), F_OK) == 0; }

    std::string Write(const std::string& name, const std::string& content) const
    {
        std::ofstream(Path(name), std::ios::binary) << content;
        return Path(name);
    }

    // A chain of new directories below this one whose path has `length`
    // characters; that path.
    std::string Deep(std::size_t length) const
    {
        std::string deep = path();
        while (deep.size() < length) {
            const std::size_t room = length - 1 - deep.size();
            deep += "/" + std::string(room <= 255 ? room : 200, 'd');
            EXPECT_EQ(mkdir(deep.c_str(), 0700), 0) << deep;
        }
        return deep;
    }

    // The whole file; "" when it is missing.
    std::string Read(const std::string& name) const
    {
        std::ifstream in(Path(name), std::ios::binary);
        return std::string(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
    }
};

}  // namespace tessaline::test

#endif
