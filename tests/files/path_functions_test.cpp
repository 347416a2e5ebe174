// The plain-named path functions.
#include <errno.h>
#include <fcntl.h>
#include <limits.h>
#include <sys/stat.h>
#include <sys/statvfs.h>
#include <unistd.h>

#include <string>

#include <gtest/gtest.h>

#include "support/temp_dir.h"
#include "tessaline/files/rvPath.h"

namespace {

using tessaline::test::TempDir;

bool IsDir(const std::string& path)
{
    struct stat info;
    return stat(path.c_str(), &info) == 0 && S_ISDIR(info.st_mode);
}

void MakeFile(const std::string& path)
{
    int fd = open(path.c_str(), O_CREAT | O_WRONLY | O_CLOEXEC, 0600);
    ASSERT_GE(fd, 0) << path;
    close(fd);
}

// Runs the test body inside a directory and returns to where it was.
class InDirectory {
public:
    explicit InDirectory(const std::string& path)
    {
        EXPECT_NE(getcwd(m_saved, sizeof m_saved), nullptr);
        EXPECT_EQ(chdir(path.c_str()), 0);
    }
    ~InDirectory() { EXPECT_EQ(chdir(m_saved), 0); }

private:
    char m_saved[PATH_MAX];
};

class UmaskOf {
public:
    explicit UmaskOf(mode_t mask) : m_saved(umask(mask)) {}
    ~UmaskOf() { umask(m_saved); }

private:
    mode_t m_saved;
};

TEST(CreateDir, MakesMissingParents)
{
    TempDir tmp;
    UmaskOf mask(022);
    EXPECT_EQ(CreateDir((tmp / "a/b/c").c_str(), 0), 1);
    for (const char* made : {"a", "a/b", "a/b/c"}) {
        EXPECT_TRUE(IsDir(tmp / made)) << made;
    }
    struct stat info;
    ASSERT_EQ(stat((tmp / "a/b/c").c_str(), &info), 0);
    EXPECT_EQ(info.st_mode & 0777, 0755u);

    EXPECT_EQ(CreateDir((tmp / "t/").c_str(), 0), 1);
    EXPECT_TRUE(IsDir(tmp / "t"));
    EXPECT_EQ(CreateDir((tmp / "a/b/c").c_str(), 0), 1);
    EXPECT_EQ(CreateDir("////", 0), 1);
}

TEST(CreateDir, ExistingNamesCountAsDone)
{
    TempDir tmp;
    MakeFile(tmp / "file");
    EXPECT_EQ(CreateDir((tmp / "file").c_str(), 0), 1);
    EXPECT_FALSE(IsDir(tmp / "file"));

    errno = 0;
    EXPECT_EQ(CreateDir((tmp / "file/sub").c_str(), 0), 0);
    EXPECT_EQ(errno, ENOTDIR);
}

TEST(CreateDir, RelativeNames)
{
    TempDir tmp;
    InDirectory inside(tmp.path());
    ASSERT_EQ(mkdir("old", 0700), 0);

    EXPECT_EQ(CreateDir("newdir", 0), 0);
    EXPECT_FALSE(IsDir("newdir"));
    EXPECT_EQ(CreateDir("old/new", 0), 1);
    EXPECT_TRUE(IsDir("old/new"));
    EXPECT_EQ(CreateDir("new1/new2", 0), 0);
    EXPECT_FALSE(IsDir("new1"));
}

TEST(CreateDir, AwkwardNames)
{
    TempDir tmp;
    InDirectory inside(tmp.path());
    EXPECT_EQ(CreateDir(nullptr, 0), 0);
    EXPECT_EQ(CreateDir("", 0), 0);
    errno = 0;
    EXPECT_EQ(CreateDir((tmp / std::string(10000, 'x')).c_str(), 0), 0);
    EXPECT_EQ(errno, ENAMETOOLONG);
    EXPECT_EQ(CreateDir(std::string(10000, '\\').c_str(), 0), 0);
    EXPECT_EQ(CreateDir("://", 0), 0);
    // Names made of backslashes are single names; none of them is made.
    EXPECT_EQ(CreateDir("a\\b\\c", 0), 0);

    std::string deep = tmp.path();
    for (int level = 0; level < 1000; ++level)
        deep += "/d";
    EXPECT_EQ(CreateDir(deep.c_str(), 0), 1);
    EXPECT_TRUE(IsDir(deep));
}

TEST(GetFullDirectoryName, ResolvesOrCopies)
{
    TempDir tmp;
    ASSERT_EQ(mkdir((tmp / "real").c_str(), 0700), 0);
    ASSERT_EQ(symlink("real", (tmp / "link").c_str()), 0);

    char out[PATH_MAX];
    EXPECT_EQ(GetFullDirectoryName((tmp / "link/../link/.").c_str(), out, sizeof out), out);
    EXPECT_EQ(out, tmp / "real");

    std::string missing = tmp / "missing";
    char shortOut[8];
    memset(shortOut, 'z', sizeof shortOut);
    GetFullDirectoryName(missing.c_str(), shortOut, sizeof shortOut);
    EXPECT_EQ(std::string(shortOut, sizeof shortOut), missing.substr(0, 7) + '\0');

    char padded[16];
    memset(padded, 'z', sizeof padded);
    GetFullDirectoryName("no/such", padded, sizeof padded);
    EXPECT_EQ(std::string(padded, sizeof padded), std::string("no/such\0\0\0\0\0\0\0\0\0", 16));

    // One buffer for both.
    std::string link = tmp / "link";
    char same[PATH_MAX];
    strcpy(same, link.c_str());
    GetFullDirectoryName(same, same, sizeof same);
    EXPECT_EQ(same, tmp / "real");

    char untouched[1] = {'z'};
    EXPECT_EQ(GetFullDirectoryName("/", untouched, 0), untouched);
    EXPECT_EQ(untouched[0], 'z');
    EXPECT_EQ(GetFullDirectoryName(nullptr, out, sizeof out), out);
    EXPECT_STREQ(out, "");
    GetFullDirectoryName(std::string(10000, '/').c_str(), out, sizeof out);
    EXPECT_STREQ(out, "/");
}

TEST(FileExists, FollowsLinks)
{
    TempDir tmp;
    MakeFile(tmp / "file");
    ASSERT_EQ(symlink("missing", (tmp / "dangling").c_str()), 0);
    EXPECT_EQ(FileExists((tmp / "file").c_str()), 1);
    EXPECT_EQ(FileExists(tmp.path().c_str()), 1);
    EXPECT_EQ(FileExists((tmp / "dangling").c_str()), 0);
    EXPECT_EQ(FileExists((tmp / "missing").c_str()), 0);
    EXPECT_EQ(FileExists(nullptr), 0);
    EXPECT_EQ(FileExists(""), 0);
}

TEST(DiskFreeSpace, MatchesStatvfs)
{
    TempDir tmp;
    auto available = [&] {
        struct statvfs info;
        EXPECT_EQ(statvfs(tmp.path().c_str(), &info), 0);
        return static_cast<long long>(info.f_bavail) * static_cast<long long>(info.f_bsize);
    };
    // Other processes write meanwhile: the answer lies between two looks,
    // give or take a little.
    constexpr long long kSlack = 1 << 20;
    long long before = available();
    long long bytes = DiskFreeSpace(tmp.path().c_str());
    long long after = available();
    EXPECT_GT(bytes, 0);
    EXPECT_GE(bytes, std::min(before, after) - kSlack);
    EXPECT_LE(bytes, std::max(before, after) + kSlack);

    EXPECT_EQ(DiskFreeSpace((tmp / "missing").c_str()), 0);
    EXPECT_EQ(DiskFreeSpace(nullptr), 0);
    EXPECT_EQ(DiskFreeSpace(std::string(10000, 'x').c_str()), 0);
}

}  // namespace
