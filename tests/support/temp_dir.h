// A fresh directory under the test's temporary area, removed with all it
// holds when the object ends.
#ifndef TESSALINE_TESTS_SUPPORT_TEMP_DIR_H
#define TESSALINE_TESTS_SUPPORT_TEMP_DIR_H

#include <stdlib.h>

#include <filesystem>
#include <string>
#include <system_error>

#include <gtest/gtest.h>

namespace tessaline::test {

class TempDir {
public:
    // Under `base` (ending in "/"), by default the test's temporary area.
    explicit TempDir(const std::string& base = ::testing::TempDir())
    {
        std::string pattern = base + "tessaline-XXXXXX";
        if (mkdtemp(pattern.data()))
            m_path = std::filesystem::canonical(pattern).string();
        EXPECT_FALSE(m_path.empty()) << "mkdtemp " << pattern;
    }

    ~TempDir()
    {
        std::error_code ignored;
        std::filesystem::remove_all(m_path, ignored);
    }

    TempDir(const TempDir&) = delete;
    TempDir& operator=(const TempDir&) = delete;

    const std::string& path() const { return m_path; }
    std::string operator/(const std::string& name) const { return m_path + "/" + name; }

private:
    std::string m_path;
};

}  // namespace tessaline::test

#endif
