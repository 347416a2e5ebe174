// A scratch directory for configuration files, with the file helpers the
// configuration tests use.
#ifndef TESSALINE_TESTS_CONFIG_TEMP_DIR_H
#define TESSALINE_TESTS_CONFIG_TEMP_DIR_H

#include <cstdio>
#include <fstream>
#include <iterator>
#include <string>

#include <sys/stat.h>
#include <unistd.h>

#include <gtest/gtest.h>

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

// A written file's text without its identification line, which must be the
// only one and the last line.
inline std::string body(const std::string& text)
{
    const std::size_t start = text.size() < 2 ? 0 : text.rfind('\n', text.size() - 2) + 1;
    const std::string last = text.substr(start);
    char month[16];
    int day, year, hour, minute, second, end = 0;
    EXPECT_EQ(std::sscanf(last.c_str(), "# Edited by Tessaline: %15[A-Za-z] %2d, %4d - %2d:%2d:%2d%n", month, &day,
                          &year, &hour, &minute, &second, &end),
              6)
        << text;
    EXPECT_EQ(last.substr(std::size_t(end)), "\n") << text;
    const std::string rest = text.substr(0, start);
    EXPECT_EQ(rest.find("Edited by"), std::string::npos) << text;
    return rest;
}

}  // namespace tessaline::test

#endif
