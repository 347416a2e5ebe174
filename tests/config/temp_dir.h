// A scratch directory for configuration files, removed with its contents.
#ifndef TESSALINE_TESTS_CONFIG_TEMP_DIR_H
#define TESSALINE_TESTS_CONFIG_TEMP_DIR_H

#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <iterator>
#include <string>

#include <ftw.h>
#include <unistd.h>

namespace tessaline::test {

class TempDir {
public:
    TempDir() : m_path("/tmp/tessaline-config-XXXXXX") { mkdtemp(&m_path[0]); }
    ~TempDir()
    {
        nftw(m_path.c_str(), [](const char* path, const struct stat*, int, FTW*) { return remove(path); }, 16,
             FTW_DEPTH | FTW_PHYS);
    }
    TempDir(const TempDir&) = delete;
    TempDir& operator=(const TempDir&) = delete;

    std::string Path(const std::string& name) const { return m_path + "/" + name; }
    bool Exists(const std::string& name) const { return access(Path(name).c_str(), F_OK) == 0; }

    std::string Write(const std::string& name, const std::string& content) const
    {
        std::ofstream(Path(name), std::ios::binary) << content;
        return Path(name);
    }

    std::string Read(const std::string& name) const
    {
        std::ifstream in(Path(name), std::ios::binary);
        return std::string(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
    }

private:
    std::string m_path;
};

}  // namespace tessaline::test

#endif
