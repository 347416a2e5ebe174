// The plain-named path functions.
#include <errno.h>
#include <limits.h>
#include <string.h>
#include <sys/stat.h>
#include <sys/vfs.h>
#include <unistd.h>

#include <filesystem>
#include <string>

#include <gtest/gtest.h>

#include "files/file_fixtures.h"
#include "files/sys.h"
#include "support/scoped_sys_calls.h"
#include "support/temp_dir.h"
#include "tessaline/files/rvPath.h"

namespace {

using namespace tessaline::test;
using tessaline::files::Sys;
using tessaline::testing::ScopedSysCalls;

TEST(CreateDir, MakesEveryMissingLevel)
{
    TempDir tmp;
    const mode_t savedMask = umask(022);
    EXPECT_EQ(CreateDir((tmp / "a/b/c/").c_str(), 0), 1);
    umask(savedMask);
    struct stat info;
    ASSERT_EQ(stat((tmp / "a/b/c").c_str(), &info), 0);
    EXPECT_EQ(info.st_mode & 0777, 0755u);

    // What exists counts as done; below a file nothing can be made.
    Put(tmp / "file", "");
    EXPECT_EQ(CreateDir((tmp / "file").c_str(), 0), 1);
    EXPECT_EQ(CreateDir((tmp / "file/sub").c_str(), 0), 0);
    EXPECT_EQ(errno, ENOTDIR);
    std::string deep = tmp.path();
    for (int level = 0; level < 1000; ++level)
        deep += "/d";
    EXPECT_EQ(CreateDir(deep.c_str(), 0), 1);
    EXPECT_TRUE(std::filesystem::is_directory(deep));

    // A relative name makes only its last level, below one that exists.
    ScopedCwd cwd(tmp.path());
    EXPECT_EQ(CreateDir("newdir", 0), 0);
    EXPECT_EQ(CreateDir("a/new", 0), 1);
    EXPECT_EQ(CreateDir("new1/new2", 0), 0);
    for (const std::string& name :
         {std::string(), std::string("://"), std::string("x\\y"), tmp / std::string(10000, 'x')})
        EXPECT_EQ(CreateDir(name.c_str(), 0), 0) << name.substr(0, 80);
    EXPECT_EQ(CreateDir(nullptr, 0), 0);
    EXPECT_FALSE(Exists("newdir") || Exists("new1") || Exists("x\\y"));
}

TEST(PathQueries, FullNamesExistenceAndFreeSpace)
{
    TempDir tmp;
    ASSERT_EQ(mkdir((tmp / "real").c_str(), 0700), 0);
    ASSERT_EQ(symlink("real", (tmp / "link").c_str()), 0);
    ASSERT_EQ(symlink("missing", (tmp / "dangling").c_str()), 0);
    char out[PATH_MAX];
    EXPECT_EQ(GetFullDirectoryName((tmp / "link/../link/.").c_str(), out, sizeof out), out);
    EXPECT_EQ(out, tmp / "real");
    GetFullDirectoryName(out, out, sizeof out);
    EXPECT_EQ(out, tmp / "real") << "path and result in one buffer";
    // What cannot be resolved is copied, cut to the buffer.
    char cut[16];
    memset(cut, 'z', sizeof cut);
    GetFullDirectoryName("no/such/file/at/all", cut, 8);
    EXPECT_EQ(std::string(cut, sizeof cut), std::string("no/such\0zzzzzzzz", 16));
    GetFullDirectoryName(nullptr, out, sizeof out);
    EXPECT_STREQ(out, "");

    EXPECT_EQ(FileExists((tmp / "link").c_str()), 1);
    EXPECT_EQ(FileExists((tmp / "dangling").c_str()), 0);
    EXPECT_EQ(FileExists(nullptr), 0);

    EXPECT_EQ(DiskFreeSpace("/no/such/path"), 0);
    ScopedSysCalls restore(Sys());
    Sys().statfs = [](const char*, struct statfs* info) {
        info->f_bavail = 3;
        info->f_bfree = 5;
        info->f_bsize = 4096;
        return 0;
    };
    EXPECT_EQ(DiskFreeSpace("/"), 3 * 4096) << "what an unprivileged process may use";
    Sys().statfs = [](const char*, struct statfs* info) {
        info->f_bavail = static_cast<fsblkcnt_t>(~0ull);
        info->f_bsize = LONG_MAX;
        return 0;
    };
    EXPECT_EQ(DiskFreeSpace("/"), LLONG_MAX) << "saturates";
}

}  // namespace
