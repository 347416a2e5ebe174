// File handles, the plain-named path functions and directory walks.
#include <vector>

#include <limits.h>
#include <sys/vfs.h>
#include <sys/wait.h>

#include "files/file_fixtures.h"
#include "files/sys.h"
#include "support/scoped_sys_calls.h"
#include "tessaline/files/rvDirIterator.h"
#include "tessaline/files/rvFileApi.h"
#include "tessaline/files/rvPath.h"
#include "util/sys.h"

using namespace tessaline::test;
using tessaline::files::Sys;
using tessaline::testing::ScopedSysCalls;

namespace {

void* const kInvalid = reinterpret_cast<void*>(static_cast<intptr_t>(-1));

// What Lock(handle, 0) answers in another process.
int LockTestFromChild(const std::string& path)
{
    const pid_t pid = fork();
    if (pid == 0) {
        _exit(Lock(CreateFile(path.c_str(), O_RDWR, 0, nullptr, 0, 0, nullptr), 0));
    }
    int status = 0;
    waitpid(pid, &status, 0);
    return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

using Names = std::multiset<std::string>;

Names Walk(const std::string& path)
{
    Names names;
    for (rvDirIterator it(path.c_str()); it != rvDirIterator(); ++it) {
        names.insert(*it);
    }
    return names;
}

long OpenDescriptors()
{
    const std::filesystem::directory_iterator fds("/proc/self/fd");
    return std::distance(begin(fds), end(fds));
}

}  // namespace

TEST(FileHandles, ReadWriteSeekSizeAndLocks)
{
    TempDir dir;
    const std::string path = dir / "data";
    void* handle = CreateFile(path.c_str(), O_RDWR | O_CREAT, 0, nullptr, O_TRUNC, 0600, nullptr);
    ASSERT_NE(kInvalid, handle);
    unsigned long done = 0;
    EXPECT_EQ(1, WriteFile(handle, "hello world", 11, &done, nullptr));
    EXPECT_EQ(11ul, done);
    EXPECT_EQ(6, SetFilePointer64(handle, 6, SEEK_SET));
    char buffer[16] = {};
    EXPECT_EQ(1, ReadFile(handle, buffer, sizeof buffer, &done, nullptr));
    EXPECT_STREQ("world", buffer);
    EXPECT_EQ(1, ReadFile(handle, buffer, sizeof buffer, &done, nullptr));
    EXPECT_EQ(0ul, done) << "the end of the file is a success";

    EXPECT_EQ(1, Lock(handle, 0)) << "testing takes no lock";
    EXPECT_EQ(1, LockTestFromChild(path));
    EXPECT_EQ(1, Lock(handle, 1));
    EXPECT_EQ(0, LockTestFromChild(path));
    EXPECT_EQ(1, Unlock(handle));
    EXPECT_EQ(1, LockTestFromChild(path));

    // The whole 64-bit offset reaches lseek, so a size past 4 GiB splits.
    EXPECT_EQ(int64_t{5} << 30, SetFilePointer64(handle, int64_t{5} << 30, SEEK_SET));
    EXPECT_EQ(1, WriteFile(handle, "!", 1, nullptr, nullptr));
    unsigned long high = 0;
    EXPECT_EQ(0x40000001ul, GetFileSize(handle, &high));
    EXPECT_EQ(1ul, high);
    EXPECT_EQ(1, CloseHandle(handle));
    EXPECT_EQ(kInvalid, CreateFile(path.c_str(), O_RDWR | O_CREAT, 0, nullptr, O_EXCL, 0600, nullptr));
    EXPECT_EQ(EEXIST, GetLastError()) << "the disposition reaches open";

    // A bad handle fails everywhere, with EBADF.
    EXPECT_EQ(0xFFFFFFFFul, GetFileSize(kInvalid, &high));
    EXPECT_EQ(0xFFFFFFFFul, high);
    EXPECT_EQ(0, ReadFile(kInvalid, buffer, 1, &done, nullptr));
    EXPECT_EQ(~0ul, done);
    EXPECT_EQ(0, CloseHandle(kInvalid));
    EXPECT_EQ(EBADF, GetLastError());
    // The text of a code, or of the last error, cut to the buffer.
    std::memset(buffer, 'x', sizeof buffer);
    EXPECT_EQ(buffer, GetLastErrorText(buffer, 5, ENOENT));
    EXPECT_EQ(std::string(std::strerror(ENOENT)).substr(0, 4), buffer);
    EXPECT_EQ('x', buffer[5]);
    EXPECT_STREQ(std::strerror(EBADF), GetLastErrorText(nullptr, 0, 0xFFFFFFFFul));
}

// Open fails with each of g_codes in turn, then opens for real.
std::vector<int> g_codes;
int g_opens, g_sleeps;

TEST(CreateFile, AttemptsAndPausesFollowTheError)
{
    TempDir dir;
    const std::string path = Put(dir / "present", "x");
    const struct {
        const char* what;
        std::vector<int> codes;
        int attempts, sleeps, error;  // error -1: the file opens
    } cases[] = {
        {"EEXIST fails at once", {EEXIST}, 1, 0, EEXIST},
        {"ENOENT pauses after each attempt", {ENOENT, ENOENT, ENOENT}, 3, 3, ENOENT},
        {"errno 0 pauses like ENOENT", {0, 0, 0}, 3, 3, 0},
        {"EACCES retries without pauses", {EACCES, EACCES, EACCES}, 3, 0, EACCES},
        {"EINTR repeats within an attempt", {EINTR, EINTR}, 3, 0, -1},
        {"a file that appears is opened", {ENOENT}, 2, 1, -1},
        {"the last error stays", {EACCES, EIO, ENOENT}, 3, 1, ENOENT},
    };
    static const auto realOpen = Sys().open;
    for (const auto& c : cases) {
        ScopedSysCalls restore(Sys());
        ScopedSysCalls noPauses(tessaline::util::Sys());
        g_codes = c.codes;
        g_opens = g_sleeps = 0;
        Sys().open = [](const char* name, int flags, mode_t mode) {
            const size_t attempt = g_opens++;
            errno = attempt < g_codes.size() ? g_codes[attempt] : 0;
            return attempt < g_codes.size() ? -1 : realOpen(name, flags, mode);
        };
        tessaline::util::Sys().nanosleep = [](const struct timespec*, struct timespec*) {
            ++g_sleeps;
            return 0;
        };
        void* handle = CreateFile(path.c_str(), O_RDONLY, 0, nullptr, 0, 0, nullptr);
        const int error = errno;
        EXPECT_EQ(c.attempts, g_opens) << c.what;
        EXPECT_EQ(c.sleeps, g_sleeps) << c.what;
        EXPECT_EQ(c.error == -1 ? 1 : 0, CloseHandle(handle)) << c.what;
        if (c.error != -1) {
            EXPECT_EQ(c.error, error) << c.what;
        }
    }
}

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

TEST(rvDirIterator, PatternsMatchByFnmatch)
{
    TempDir dir;
    for (const char* name : {"a.log", ".log", ".hidden", "a.c", "b.c", "bb.c", "new\nline.txt", "sub/x"}) {
        Put(dir / name, "x");
    }
    const Names all = {".", "..", "a.log", ".log", ".hidden", "a.c", "b.c", "bb.c", "new\nline.txt", "sub"};
    const struct {
        std::string path;
        Names expected;
    } cases[] = {
        {dir.path(), all},
        {dir.path() + "/", all},
        {dir / "?.c", {"a.c", "b.c"}},
        {dir / "[!a]*.c", {"b.c", "bb.c"}},
        {dir / ".*", {".", "..", ".hidden", ".log"}},
        {"/no/such/dir/*", {}},
        {dir / "a.c/*", {}},
    };
    for (const auto& c : cases) {
        EXPECT_EQ(c.expected, Walk(c.path)) << c.path;
    }
    EXPECT_TRUE(rvDirIterator(nullptr) == rvDirIterator());
    ScopedCwd cwd(dir.path());
    EXPECT_EQ(Names({"a.log", ".log"}), Walk("./*.log"));
    EXPECT_EQ(Names(), Walk("*.log")) << "no directory part opens nothing";

    // A failing read or open ends the walk, with the error in errno.
    ScopedSysCalls restore(Sys());
    Sys().readdir = [](DIR*) -> dirent* {
        errno = EIO;
        return nullptr;
    };
    errno = 0;
    EXPECT_TRUE(rvDirIterator(".") == rvDirIterator());
    EXPECT_EQ(EIO, errno);
    Sys().opendir = [](const char*) -> DIR* { return nullptr; };
    EXPECT_TRUE(rvDirIterator(".") == rvDirIterator());
}

TEST(rvDirIterator, CopiesShareOneWalk)
{
    TempDir dir;
    Put(dir / "a", "");
    Put(dir / "b", "");
    const long baseline = OpenDescriptors();
    rvDirIterator first(dir.path().c_str());
    rvDirIterator copy(first);
    EXPECT_TRUE(copy == first);
    EXPECT_FALSE(copy == rvDirIterator(dir.path().c_str())) << "separate walks never equal";
    EXPECT_FALSE(copy == rvDirIterator());
    EXPECT_EQ(baseline + 1, OpenDescriptors()) << "one directory for all copies";

    std::set<std::string> seen = {*first};
    ++copy;
    EXPECT_EQ(std::string(*copy), *first) << "the other copy reads the new entry";
    seen.insert(*copy);
    rvDirIterator old = first++;
    EXPECT_TRUE(old == first);
    rvDirIterator assigned;
    assigned = first;
    rvDirIterator& alias = assigned;
    assigned = alias;
    for (; assigned != rvDirIterator(); ++assigned) {
        seen.insert(*assigned);
    }
    EXPECT_EQ(4u, seen.size()) << "every entry once, . and .. included";
    EXPECT_TRUE(copy == first) << "other copies still hold the walk";
    ++copy;
    EXPECT_TRUE(copy == rvDirIterator()) << "and end on their own increment";
    old = first = rvDirIterator();
    EXPECT_EQ(baseline, OpenDescriptors()) << "the last reference closes the directory";
}
