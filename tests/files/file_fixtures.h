// What every file test starts from: the usual headers, a temporary
// directory, and small helpers to make and read files.
#ifndef TESSALINE_TESTS_FILES_FILE_FIXTURES_H
#define TESSALINE_TESTS_FILES_FILE_FIXTURES_H

#include <cerrno>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <set>
#include <string>
#include <system_error>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <gtest/gtest.h>

#include "support/temp_dir.h"

namespace tessaline::test {

// Writes `content` to `path`, making its directories first; returns `path`.
inline std::string Put(const std::string& path, const std::string& content)
{
    std::filesystem::create_directories(std::filesystem::path(path).parent_path());
    std::ofstream(path, std::ios::binary) << content;
    return path;
}

// The whole file, or "<missing>".
inline std::string Slurp(const std::string& path)
{
    std::ifstream in(path, std::ios::binary);
    return in ? std::string(std::istreambuf_iterator<char>(in), {}) : "<missing>";
}

// Every path below `top`, relative: a directory with "/" behind it, a file
// with "=" and its content.
inline std::set<std::string> Tree(const std::string& top)
{
    std::set<std::string> shape;
    for (const auto& entry : std::filesystem::recursive_directory_iterator(top)) {
        const std::string name = entry.path().lexically_relative(top).string();
        shape.insert(entry.is_directory() ? name + "/" : name + "=" + Slurp(entry.path().string()));
    }
    return shape;
}

// Also true for a dangling symbolic link.
inline bool Exists(const std::string& path)
{
    struct stat info;
    return lstat(path.c_str(), &info) == 0;
}

// Works in `directory` while the object lives.
class ScopedCwd {
public:
    explicit ScopedCwd(const std::string& directory) : m_saved(std::filesystem::current_path())
    {
        std::filesystem::current_path(directory);
    }
    ~ScopedCwd()
    {
        std::error_code ignored;
        std::filesystem::current_path(m_saved, ignored);
    }
    ScopedCwd(const ScopedCwd&) = delete;
    ScopedCwd& operator=(const ScopedCwd&) = delete;

private:
    std::filesystem::path m_saved;
};

}  // namespace tessaline::test

#endif
