// Slash translators and file-system questions of rvFilename.
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <string>

#include <gtest/gtest.h>

#include "support/temp_dir.h"
#include "tessaline/files/rvFilename.h"

namespace {

using tessaline::test::TempDir;

std::string ToUnix(std::string text) { return rvFilename::XlatPathToUNIX(text.data()); }
std::string ToDos(std::string text) { return rvFilename::XlatPathToDOS(text.data()); }

void MakeFile(const std::string& path)
{
    int fd = open(path.c_str(), O_CREAT | O_WRONLY | O_CLOEXEC, 0600);
    ASSERT_GE(fd, 0) << path;
    close(fd);
}

TEST(rvFilenameTranslate, Texts)
{
    EXPECT_EQ(ToUnix("a\\b\\c"), "a/b/c");
    EXPECT_EQ(ToUnix("http:\\\\host\\a"), "http://host/a");
    EXPECT_EQ(ToDos("/a/b"), "\\a\\b");
    EXPECT_EQ(ToDos("http://host/a/b"), "http://host\\a\\b");
    EXPECT_EQ(ToDos("file:///a/b"), "file:///a\\b");
    EXPECT_EQ(ToDos("://"), "://");
    EXPECT_EQ(ToDos("a://b://c/d"), "a://b:\\\\c\\d");
    EXPECT_EQ(rvFilename::XlatPathToUNIX(nullptr), nullptr);
    EXPECT_EQ(rvFilename::XlatPathToDOS(nullptr), nullptr);

    std::string text = "a\\b";
    EXPECT_EQ(rvFilename::NormalizePath(text.data()), text.data());
    EXPECT_EQ(text, "a/b");

    // Only the first 4095 characters are translated.
    std::string slashes(5000, '\\');
    rvFilename::XlatPathToUNIX(slashes.data());
    EXPECT_EQ(slashes, std::string(4095, '/') + std::string(905, '\\'));
    slashes.assign(5000, '/');
    rvFilename::XlatPathToDOS(slashes.data());
    EXPECT_EQ(slashes, std::string(4095, '\\') + std::string(905, '/'));
}

TEST(rvFilenameTranslate, Ropes)
{
    rvFilename::rope url("http://host/a");
    EXPECT_EQ(&rvFilename::XlatPathToDOS(url), &url);
    EXPECT_EQ(url, rvFilename::rope("http:\\\\host\\a"));
    EXPECT_EQ(rvFilename::XlatPathToUNIX(url), rvFilename::rope("http://host/a"));

    rvFilename::rope windows("c:\\x\\y");
    EXPECT_EQ(rvFilename::NormalizePath(windows), rvFilename::rope("c:/x/y"));

    // No limit on ropes, and embedded NULs travel.
    rvFilename::rope longRope(std::string(6000, '\\').c_str());
    longRope.push_back('\0');
    longRope.push_back('\\');
    rvFilename::XlatPathToUNIX(longRope);
    EXPECT_EQ(longRope.size(), 6002u);
    EXPECT_EQ(longRope.find('\\'), rvFilename::rope::npos);

    rvFilename::rope empty;
    EXPECT_TRUE(rvFilename::XlatPathToDOS(empty).empty());
}

TEST(rvFilenameQuery, IsDirectory)
{
    TempDir dir;
    MakeFile(dir / "file");
    ASSERT_EQ(symlink(dir.path().c_str(), (dir / "link").c_str()), 0);

    for (const std::string& yes : {dir.path(), dir.path() + "/", dir.path() + "//", dir.path() + "\\",
                                   dir.path() + "/\\/", dir / "link", std::string("/"),
                                   dir / std::string(9000, '/')}) {
        EXPECT_EQ(rvFilename::IsDirectory(yes.c_str()), 1) << yes;
    }
    for (const std::string& no : {dir / "file", dir / "file/", dir / "missing", dir / "missing\\\\",
                                  std::string(10000, 'a')}) {
        EXPECT_EQ(rvFilename::IsDirectory(no.c_str()), 0) << no.substr(0, 80);
    }
    EXPECT_EQ(rvFilename::IsDirectory(nullptr), 0);
    EXPECT_EQ(rvFilename::IsDirectory(""), 0);
    EXPECT_EQ(rvFilename::IsDirectory(std::string(10000, '/').c_str()), 1);
    // A missing name with thousands of separators behind it.
    EXPECT_EQ(rvFilename::IsDirectory((dir / "missing" + std::string(4000, '/')).c_str()), 0);

    rvFilename name(dir.path().c_str(), 0);
    EXPECT_EQ(name.IsDirectory(), 1);
}

TEST(rvFilenameQuery, ExistsAndEmpty)
{
    TempDir dir;
    MakeFile(dir / "file");
    ASSERT_EQ(chmod((dir / "file").c_str(), 0400), 0);

    rvFilename file((dir / "file").c_str(), 0);
    EXPECT_EQ(file.Exists(F_OK), 1);
    EXPECT_EQ(file.Exists(R_OK), 1);
    EXPECT_EQ(rvFilename::Exists((dir / "file").c_str(), F_OK), 1);
    errno = 0;
    EXPECT_EQ(rvFilename::Exists((dir / "missing").c_str(), F_OK), 0);
    EXPECT_EQ(errno, ENOENT);
    EXPECT_EQ(rvFilename::Exists(nullptr, F_OK), 0);

    rvFilename none;
    EXPECT_EQ(none.Empty(nullptr), 1);
    EXPECT_EQ(none.Empty(""), 1);
    EXPECT_EQ(none.Empty("a"), 0);
    rvFilename a("a", 0);
    EXPECT_EQ(a.Empty(nullptr), 0);
    EXPECT_EQ(a.Empty(""), 1);
}

}  // namespace
