#include <cerrno>
#include <chrono>
#include <climits>
#include <cstring>
#include <string>

#include <fcntl.h>
#include <sys/wait.h>
#include <unistd.h>

#include <gtest/gtest.h>

#include "files/sys.h"
#include "files/temp_tree.h"
#include "tessaline/files/rvFileApi.h"

using tessaline::files::ScopedSysCalls;
using tessaline::files::Sys;
using tessaline::test::ReadAll;
using tessaline::test::TempTree;

namespace {

void* const kInvalid = reinterpret_cast<void*>(static_cast<intptr_t>(-1));

// Counts the opens and pauses of CreateFile. Open fails with each code of
// `failures` in turn; once they are used up it opens for real.
struct OpenScript {
    static inline int opens = 0;
    static inline int sleeps = 0;
    static inline const int* failures = nullptr;
    static inline int failureCount = 0;

    static void Install(const int* codes, int count)
    {
        opens = sleeps = 0;
        failures = codes;
        failureCount = count;
        static const auto realOpen = Sys().open;
        Sys().open = [](const char* path, int flags, mode_t mode) {
            if (opens < failureCount) {
                errno = failures[opens++];
                return -1;
            }
            ++opens;
            return realOpen(path, flags, mode);
        };
        Sys().nanosleep = [](const struct timespec*, struct timespec*) {
            ++sleeps;
            return 0;
        };
    }
};

int ChildExitCode(pid_t pid)
{
    int status = 0;
    waitpid(pid, &status, 0);
    return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

// What Lock(handle, 0) answers in another process for the same file.
int LockTestFromChild(const std::string& path)
{
    const pid_t pid = fork();
    if (pid == 0) {
        void* handle = CreateFile(path.c_str(), O_RDWR, 0, nullptr, 0, 0, nullptr);
        _exit(handle == kInvalid ? 2 : Lock(handle, 0));
    }
    return ChildExitCode(pid);
}

}  // namespace

TEST(FileHandles, WriteSeekReadAndSize)
{
    TempTree tree;
    const std::string path = tree.Path("data.bin");
    void* handle = CreateFile(path.c_str(), O_RDWR | O_CREAT, 0, nullptr, O_TRUNC, 0600, nullptr);
    ASSERT_NE(kInvalid, handle);

    unsigned long done = 0;
    EXPECT_EQ(1, WriteFile(handle, "hello world", 11, &done, nullptr));
    EXPECT_EQ(11ul, done);
    EXPECT_EQ(11, GetFileSize64(handle));

    EXPECT_EQ(6, SetFilePointer64(handle, 6, SEEK_SET));
    char buffer[16] = {};
    EXPECT_EQ(1, ReadFile(handle, buffer, sizeof buffer, &done, nullptr));
    EXPECT_EQ(5ul, done);
    EXPECT_STREQ("world", buffer);
    EXPECT_EQ(1, ReadFile(handle, buffer, sizeof buffer, &done, nullptr));
    EXPECT_EQ(0ul, done) << "end of file is a success with nothing read";

    // The whole 64-bit offset reaches lseek, so a size beyond 4 GiB splits
    // into its two halves.
    const int64_t far = (int64_t{5} << 30);
    EXPECT_EQ(far, SetFilePointer64(handle, far, SEEK_SET));
    EXPECT_EQ(1, WriteFile(handle, "!", 1, nullptr, nullptr));
    unsigned long high = 0;
    EXPECT_EQ(0x40000001ul, GetFileSize(handle, &high));
    EXPECT_EQ(1ul, high);
    EXPECT_EQ(0x40000001ul, GetFileSize(handle, nullptr));

    EXPECT_EQ(1, CloseHandle(handle));
}

TEST(FileHandles, BadHandleFailsEverywhere)
{
    void* bad = kInvalid;
    unsigned long high = 0;
    EXPECT_EQ(0xFFFFFFFFul, GetFileSize(bad, &high));
    EXPECT_EQ(0xFFFFFFFFul, high);
    EXPECT_EQ(-1, GetFileSize64(bad));
    EXPECT_EQ(-1, SetFilePointer64(bad, 0, SEEK_SET));
    EXPECT_EQ(EBADF, GetLastError());

    char buffer[4];
    unsigned long done = 0;
    EXPECT_EQ(0, ReadFile(bad, buffer, sizeof buffer, &done, nullptr));
    EXPECT_EQ(static_cast<unsigned long>(-1), done);
    EXPECT_EQ(0, ReadFile(bad, buffer, sizeof buffer, nullptr, nullptr));
    EXPECT_EQ(0, WriteFile(bad, buffer, sizeof buffer, &done, nullptr));
    EXPECT_EQ(0, Lock(bad, 0));
    EXPECT_EQ(0, Unlock(bad));
    EXPECT_EQ(0, CloseHandle(bad));
    EXPECT_EQ(EBADF, GetLastError());
}

TEST(FileHandles, InterruptedTransfersAreRepeated)
{
    TempTree tree;
    const std::string path = tree.Write("x.txt", "abc");
    void* handle = CreateFile(path.c_str(), O_RDWR, 0, nullptr, 0, 0, nullptr);
    ASSERT_NE(kInvalid, handle);
    {
        ScopedSysCalls restore;
        static int calls;
        calls = 0;
        static const auto realRead = Sys().read;
        Sys().read = [](int fd, void* buffer, size_t count) -> ssize_t {
            if (++calls < 3) {
                errno = EINTR;
                return -1;
            }
            return realRead(fd, buffer, count);
        };
        char buffer[8] = {};
        unsigned long done = 0;
        EXPECT_EQ(1, ReadFile(handle, buffer, sizeof buffer, &done, nullptr));
        EXPECT_EQ(3, calls);
        EXPECT_EQ(3ul, done);

        Sys().write = [](int, const void*, size_t) -> ssize_t {
            errno = ENOSPC;
            return -1;
        };
        EXPECT_EQ(0, WriteFile(handle, "z", 1, &done, nullptr));
        EXPECT_EQ(static_cast<unsigned long>(-1), done);
        EXPECT_EQ(ENOSPC, GetLastError());
    }
    EXPECT_EQ(1, CloseHandle(handle));
}

TEST(CreateFile, AttemptsAndPausesFollowTheError)
{
    TempTree tree;
    const std::string path = tree.Write("present.txt", "x");
    struct Case {
        const char* what;
        int failures[3];
        int failureCount;
        bool opens;
        int attempts;
        int sleeps;
        int error;
    };
    const Case cases[] = {
        {"EEXIST fails at once", {EEXIST}, 1, false, 1, 0, EEXIST},
        {"ENOENT pauses after every attempt", {ENOENT, ENOENT, ENOENT}, 3, false, 3, 3, ENOENT},
        {"an errno of 0 counts as ENOENT", {0, 0, 0}, 3, false, 3, 3, 0},
        {"EACCES retries without a pause", {EACCES, EACCES, EACCES}, 3, false, 3, 0, EACCES},
        {"EINTR repeats within one attempt", {EINTR, EINTR}, 2, true, 3, 0, 0},
        {"a file that appears is opened later", {ENOENT}, 1, true, 2, 1, 0},
        {"the last attempt's error stays", {EACCES, EIO, ENOENT}, 3, false, 3, 1, ENOENT},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.what);
        ScopedSysCalls restore;
        OpenScript::Install(c.failures, c.failureCount);
        void* handle = CreateFile(path.c_str(), O_RDONLY, 0, nullptr, 0, 0, nullptr);
        const int error = errno;
        EXPECT_EQ(c.attempts, OpenScript::opens);
        EXPECT_EQ(c.sleeps, OpenScript::sleeps);
        if (c.opens) {
            EXPECT_NE(kInvalid, handle);
            EXPECT_EQ(1, CloseHandle(handle));
        } else {
            EXPECT_EQ(kInvalid, handle);
            EXPECT_EQ(c.error, error);
        }
    }
}

TEST(CreateFile, FlagsPassThroughWithLargeFile)
{
    ScopedSysCalls restore;
    static int seenFlags;
    static mode_t seenMode;
    Sys().open = [](const char*, int flags, mode_t mode) {
        seenFlags = flags;
        seenMode = mode;
        errno = EEXIST;
        return -1;
    };
    EXPECT_EQ(kInvalid, CreateFile("x", O_RDWR | O_CREAT, 7, nullptr, O_EXCL, 0640, nullptr));
    EXPECT_EQ(O_RDWR | O_CREAT | O_EXCL | 0x8000, seenFlags);
    EXPECT_EQ(static_cast<mode_t>(0640), seenMode);
}

TEST(CreateFile, MissingFileTakesThreeSeconds)
{
    TempTree tree;
    const auto start = std::chrono::steady_clock::now();
    void* handle = CreateFile(tree.Path("missing").c_str(), O_RDONLY, 0, nullptr, 0, 0, nullptr);
    const int error = errno;
    const auto elapsed = std::chrono::steady_clock::now() - start;
    EXPECT_EQ(kInvalid, handle);
    EXPECT_EQ(ENOENT, error);
    EXPECT_GE(elapsed, std::chrono::milliseconds(2900));
}

TEST(CreateFile, ExclusiveCreateOfExistingFileFailsAtOnce)
{
    TempTree tree;
    const std::string path = tree.Write("there.txt", "keep");
    const auto start = std::chrono::steady_clock::now();
    void* handle =
        CreateFile(path.c_str(), O_RDWR | O_CREAT, 0, nullptr, O_EXCL, 0600, nullptr);
    EXPECT_EQ(kInvalid, handle);
    EXPECT_EQ(EEXIST, GetLastError());
    EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::milliseconds(500));
    EXPECT_EQ("keep", ReadAll(path));
}

TEST(CreateFile, UnreadableFileFailsWithoutPauses)
{
    if (geteuid() == 0) {
        GTEST_SKIP() << "root bypasses permission bits; the seam test covers EACCES";
    }
    TempTree tree;
    const std::string path = tree.Write("secret.txt", "x");
    chmod(path.c_str(), 0);
    const auto start = std::chrono::steady_clock::now();
    EXPECT_EQ(kInvalid, CreateFile(path.c_str(), O_RDONLY, 0, nullptr, 0, 0, nullptr));
    EXPECT_EQ(EACCES, GetLastError());
    EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::milliseconds(500));
}

TEST(FileLocks, TestFromAnotherProcess)
{
    TempTree tree;
    const std::string path = tree.Write("locked.txt", "data");
    void* handle = CreateFile(path.c_str(), O_RDWR, 0, nullptr, 0, 0, nullptr);
    ASSERT_NE(kInvalid, handle);

    EXPECT_EQ(1, Lock(handle, 0)) << "testing takes no lock";
    EXPECT_EQ(1, LockTestFromChild(path));

    EXPECT_EQ(1, Lock(handle, 1));
    EXPECT_EQ(1, Lock(handle, 0)) << "a process's own lock does not block it";
    EXPECT_EQ(0, LockTestFromChild(path));

    EXPECT_EQ(1, Unlock(handle));
    EXPECT_EQ(1, LockTestFromChild(path));
    EXPECT_EQ(1, CloseHandle(handle));
}

TEST(GetLastErrorText, TextsForCodesAndBuffers)
{
    const std::string enoent = std::strerror(ENOENT);
    EXPECT_EQ(enoent, GetLastErrorText(nullptr, 0, ENOENT));

    char buffer[64];
    std::memset(buffer, 'x', sizeof buffer);
    EXPECT_EQ(buffer, GetLastErrorText(buffer, sizeof buffer, ENOENT));
    EXPECT_EQ(enoent, buffer);

    std::memset(buffer, 'x', sizeof buffer);
    GetLastErrorText(buffer, 5, ENOENT);
    EXPECT_EQ(enoent.substr(0, 4), buffer);
    EXPECT_EQ('x', buffer[5]);

    errno = EACCES;
    EXPECT_STREQ(std::strerror(EACCES), GetLastErrorText(nullptr, 0, 0xFFFFFFFFul));
    errno = EBADF;
    EXPECT_STREQ(std::strerror(EBADF), GetLastErrorText(nullptr, 0, static_cast<unsigned long>(-1)));
    // An unknown code's text lives only until the next strerror call.
    const std::string unknown = std::strerror(9999);
    EXPECT_EQ(unknown, GetLastErrorText(nullptr, 0, 9999));
}
