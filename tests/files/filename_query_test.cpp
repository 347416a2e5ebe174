// Slash translators and IsDirectory.
#include <fcntl.h>
#include <unistd.h>

#include <string>

#include <gtest/gtest.h>

#include "support/temp_dir.h"
#include "tessaline/files/rvFilename.h"

namespace {

using tessaline::test::TempDir;

std::string ToUnix(std::string text)
{
    return rvFilename::XlatPathToUNIX(text.data());
}
std::string ToDos(std::string text)
{
    return rvFilename::XlatPathToDOS(text.data());
}

TEST(rvFilenameTranslate, TextsAndRopes)
{
    EXPECT_EQ(ToUnix("a\\b\\c"), "a/b/c");
    EXPECT_EQ(ToDos("/a/b"), "\\a\\b");
    EXPECT_EQ(ToDos("http://host/a/b"), "http://host\\a\\b");
    EXPECT_EQ(ToDos("file:///a/b"), "file:///a\\b");
    EXPECT_EQ(ToDos("a://b://c/d"), "a://b:\\\\c\\d");
    EXPECT_EQ(rvFilename::XlatPathToDOS(nullptr), nullptr);
    // Only the first 4095 characters are translated.
    EXPECT_EQ(ToUnix(std::string(5000, '\\')), std::string(4095, '/') + std::string(905, '\\'));

    // The rope forms have no URL rule and no limit.
    rvFilename::rope url("http://host/a");
    EXPECT_EQ(&rvFilename::XlatPathToDOS(url), &url);
    EXPECT_EQ(url, rvFilename::rope("http:\\\\host\\a"));
    EXPECT_EQ(rvFilename::NormalizePath(url), rvFilename::rope("http://host/a"));
    rvFilename::rope longRope(std::string(6000, '\\').c_str());
    rvFilename::XlatPathToUNIX(longRope);
    EXPECT_EQ(longRope, rvFilename::rope(std::string(6000, '/').c_str()));
}

TEST(rvFilenameQuery, IsDirectory)
{
    TempDir dir;
    close(open((dir / "file").c_str(), O_CREAT | O_WRONLY | O_CLOEXEC, 0600));
    ASSERT_EQ(symlink(dir.path().c_str(), (dir / "link").c_str()), 0);

    for (const std::string& yes : {dir.path() + "/", dir.path() + "//", dir.path() + "\\", dir / "link",
                                   dir / std::string(9000, '/'), std::string(10000, '/')})
        EXPECT_EQ(rvFilename::IsDirectory(yes.c_str()), 1) << yes.substr(0, 80);
    for (const std::string& no : {dir / "file", dir / "file/", dir / "missing\\\\", std::string(10000, 'a'),
                                  dir / "missing" + std::string(4000, '/'), std::string()})
        EXPECT_EQ(rvFilename::IsDirectory(no.c_str()), 0) << no.substr(0, 80);
    EXPECT_EQ(rvFilename::IsDirectory(nullptr), 0);
    EXPECT_EQ(rvFilename(dir.path().c_str(), 0).IsDirectory(), 1);
    EXPECT_EQ(rvFilename((dir / "file").c_str(), 0).Exists(F_OK), 1);
    EXPECT_EQ(rvFilename::Exists((dir / "missing").c_str(), F_OK), 0);
}

}  // namespace
