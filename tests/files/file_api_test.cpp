#include <cerrno>
#include <cstring>
#include <string>

#include <fcntl.h>
#include <sys/wait.h>
#include <unistd.h>

#include <gtest/gtest.h>

#include "files/file_fixtures.h"
#include "files/sys.h"
#include "support/scoped_sys_calls.h"
#include "util/sys.h"
#include "support/temp_dir.h"
#include "tessaline/files/rvFileApi.h"

using namespace tessaline::test;
using tessaline::files::Sys;
using tessaline::testing::ScopedSysCalls;

namespace {

void* const kInvalid = reinterpret_cast<void*>(static_cast<intptr_t>(-1));

// Open fails with each of `codes` in turn, then opens for real; opens and
// pauses are counted.
struct OpenScript {
    static inline int opens, sleeps, failures;
    static inline const int* codes;

    static void Install(const int* failWith, int count)
    {
        opens = sleeps = 0;
        codes = failWith;
        failures = count;
        static const auto realOpen = Sys().open;
        Sys().open = [](const char* path, int flags, mode_t mode) {
            if (opens < failures) {
                errno = codes[opens++];
                return -1;
            }
            ++opens;
            return realOpen(path, flags, mode);
        };
        tessaline::util::Sys().nanosleep = [](const struct timespec*, struct timespec*) {
            ++sleeps;
            return 0;
        };
    }
};

// What Lock(handle, 0) answers in another process.
int LockTestFromChild(const std::string& path)
{
    const pid_t pid = fork();
    if (pid == 0) {
        void* handle = CreateFile(path.c_str(), O_RDWR, 0, nullptr, 0, 0, nullptr);
        _exit(handle == kInvalid ? 2 : Lock(handle, 0));
    }
    int status = 0;
    waitpid(pid, &status, 0);
    return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

}  // namespace

TEST(FileHandles, ReadWriteSeekAndSize)
{
    TempDir dir;
    void* handle = CreateFile((dir / "data").c_str(), O_RDWR | O_CREAT, 0, nullptr, O_TRUNC, 0600, nullptr);
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

    // The whole 64-bit offset reaches lseek, so a size past 4 GiB splits.
    EXPECT_EQ(int64_t{5} << 30, SetFilePointer64(handle, int64_t{5} << 30, SEEK_SET));
    EXPECT_EQ(1, WriteFile(handle, "!", 1, nullptr, nullptr));
    unsigned long high = 0;
    EXPECT_EQ(0x40000001ul, GetFileSize(handle, &high));
    EXPECT_EQ(1ul, high);
    EXPECT_EQ(1, CloseHandle(handle));
    EXPECT_EQ(kInvalid, CreateFile((dir / "data").c_str(), O_RDWR | O_CREAT, 0, nullptr, O_EXCL, 0600, nullptr));
    EXPECT_EQ(EEXIST, GetLastError()) << "the disposition reaches open";

    // A bad handle fails everywhere, with EBADF.
    EXPECT_EQ(0xFFFFFFFFul, GetFileSize(kInvalid, &high));
    EXPECT_EQ(0xFFFFFFFFul, high);
    EXPECT_EQ(0, ReadFile(kInvalid, buffer, 1, &done, nullptr));
    EXPECT_EQ(~0ul, done);
    EXPECT_EQ(0, CloseHandle(kInvalid));
    EXPECT_EQ(EBADF, GetLastError());
}

TEST(CreateFile, AttemptsAndPausesFollowTheError)
{
    TempDir dir;
    const std::string path = Put(dir / "present", "x");
    const struct {
        const char* what;
        int codes[3];
        int count, attempts, sleeps, error;  // error -1: the file opens
    } cases[] = {
        {"EEXIST fails at once", {EEXIST}, 1, 1, 0, EEXIST},
        {"ENOENT pauses after each attempt", {ENOENT, ENOENT, ENOENT}, 3, 3, 3, ENOENT},
        {"errno 0 pauses like ENOENT", {0, 0, 0}, 3, 3, 3, 0},
        {"EACCES retries without pauses", {EACCES, EACCES, EACCES}, 3, 3, 0, EACCES},
        {"EINTR repeats within an attempt", {EINTR, EINTR}, 2, 3, 0, -1},
        {"a file that appears is opened", {ENOENT}, 1, 2, 1, -1},
        {"the last error stays", {EACCES, EIO, ENOENT}, 3, 3, 1, ENOENT},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.what);
        ScopedSysCalls restore(Sys());
        ScopedSysCalls noPauses(tessaline::util::Sys());
        OpenScript::Install(c.codes, c.count);
        void* handle = CreateFile(path.c_str(), O_RDONLY, 0, nullptr, 0, 0, nullptr);
        const int error = errno;
        EXPECT_EQ(c.attempts, OpenScript::opens);
        EXPECT_EQ(c.sleeps, OpenScript::sleeps);
        EXPECT_EQ(c.error == -1, handle != kInvalid);
        if (c.error == -1) {
            CloseHandle(handle);
        } else {
            EXPECT_EQ(c.error, error);
        }
    }
}

TEST(FileLocks, TestedFromAnotherProcess)
{
    TempDir dir;
    const std::string path = Put(dir / "locked", "data");
    void* handle = CreateFile(path.c_str(), O_RDWR, 0, nullptr, 0, 0, nullptr);
    EXPECT_EQ(1, Lock(handle, 0)) << "testing takes no lock";
    EXPECT_EQ(1, LockTestFromChild(path));
    EXPECT_EQ(1, Lock(handle, 1));
    EXPECT_EQ(0, LockTestFromChild(path));
    EXPECT_EQ(1, Unlock(handle));
    EXPECT_EQ(1, LockTestFromChild(path));
    CloseHandle(handle);
}

TEST(GetLastErrorText, TextsForCodesAndBuffers)
{
    char buffer[64];
    std::memset(buffer, 'x', sizeof buffer);
    EXPECT_EQ(buffer, GetLastErrorText(buffer, 5, ENOENT));
    EXPECT_EQ(std::string(std::strerror(ENOENT)).substr(0, 4), buffer) << "cut to the buffer";
    EXPECT_EQ('x', buffer[5]);
    errno = EACCES;
    EXPECT_STREQ(std::strerror(EACCES), GetLastErrorText(nullptr, 0, 0xFFFFFFFFul)) << "the last error";
}
