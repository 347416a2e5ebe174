// A full disk, a file size limit, a read-only directory and failing calls
// during rvCopyFile and WriteFile: each case gives its result and leaves the
// files as listed. Limits and dropped privileges stay in a child process.
#include <cerrno>
#include <climits>
#include <csignal>
#include <cstring>
#include <string>

#include <fcntl.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <gtest/gtest.h>

#include "files/file_fixtures.h"
#include "files/sys.h"
#include "support/scoped_sys_calls.h"
#include "util/sys.h"
#include "files/sys_fakes.h"
#include "support/temp_dir.h"
#include "tessaline/files/rvCopy.h"
#include "tessaline/files/rvFileApi.h"

using namespace tessaline::test;
using tessaline::files::Sys;
using tessaline::files::SysCalls;
using tessaline::testing::ScopedSysCalls;

namespace {

const std::string kSource = [] {
    std::string text;
    for (int line = 0; text.size() < 40000; ++line) {
        text += "source line " + std::to_string(line) + "\n";
    }
    return text;
}();
const std::string kOld = "old target data\n";
const std::string kMissing = "<missing>";
constexpr uid_t kNobody = 65534;

const SysCalls kReal = Sys();

struct Paths {
    std::string source;
    std::string target;
    std::string readOnly;  // a directory with an existing target, made read-only
};

bool IsTarget(const char* path)
{
    const size_t length = std::strlen(path);
    return length >= 6 && std::strcmp(path + length - 6, "target") == 0;
}

int CopyOver(const Paths& paths, unsigned overwrite, unsigned move = 0)
{
    return rvCopyFile(paths.source.c_str(), paths.target.c_str(), 0, overwrite, 0, move, nullptr, nullptr, 0644);
}

void* const kBadHandle = reinterpret_cast<void*>(static_cast<intptr_t>(-1));

// WriteFile of `data` at the end of `path`: the count written, or -errno.
int Append(const std::string& path, const std::string& data)
{
    void* handle = CreateFile(path.c_str(), O_WRONLY | O_APPEND | O_CLOEXEC, 0, nullptr, 0, 0, nullptr);
    if (handle == kBadHandle) {
        return INT_MIN;
    }
    unsigned long done = 0;
    const int ok = WriteFile(handle, data.data(), data.size(), &done, nullptr);
    const int error = errno;
    CloseHandle(handle);
    if (ok == 0) {
        EXPECT_EQ(ULONG_MAX, done) << "a failed write reports -1 as its count";
        return -error;
    }
    return static_cast<int>(done);
}

void LimitFileSize(rlim_t bytes)
{
    signal(SIGXFSZ, SIG_IGN);
    const struct rlimit limit = {bytes, bytes};
    setrlimit(RLIMIT_FSIZE, &limit);
}

// Runs `action` in a child with `fault` applied there (a limit stays with
// the child); as root the child also drops to an unprivileged user, so that
// permission bits count. Returns the action's result.
int RunInChild(void (*fault)(), int (*action)(const Paths&), const Paths& paths)
{
    int channel[2];
    if (pipe(channel) != 0) {
        return INT_MIN;
    }
    const pid_t child = fork();
    if (child == 0) {
        close(channel[0]);
        if (geteuid() == 0 && (setgid(kNobody) != 0 || setuid(kNobody) != 0)) {
            _exit(2);
        }
        if (fault != nullptr) {
            fault();
        }
        const int result = action(paths);
        _exit(write(channel[1], &result, sizeof result) == sizeof result ? 0 : 1);
    }
    close(channel[1]);
    int result = INT_MIN;
    if (read(channel[0], &result, sizeof result) != sizeof result) {
        result = INT_MIN;
    }
    close(channel[0]);
    int status = 0;
    waitpid(child, &status, 0);
    return result;
}

// Lets an unprivileged child reach the test's files.
void HandOver(const std::string& top)
{
    if (geteuid() != 0) {
        return;
    }
    chmod(top.c_str(), 0755);
    for (const auto& entry : std::filesystem::recursive_directory_iterator(top)) {
        lchown(entry.path().c_str(), kNobody, kNobody);
    }
    lchown(top.c_str(), kNobody, kNobody);
}

struct FaultCase {
    const char* what;
    bool inChild;
    void (*fault)();
    int (*action)(const Paths&);
    int result;
    std::string target;  // what the target holds afterwards
};

}  // namespace

TEST(FaultInjection, OldDataAndResultsUnderFailures)
{
    const FaultCase cases[] = {
        // Failures before the target is opened leave it byte for byte.
        {"target open refused (EACCES)", false,
         [] {
             Sys().openat = [](int d, const char* p, int f, mode_t m) {
                 return IsTarget(p) ? Fail(EACCES) : kReal.openat(d, p, f, m);
             };
         },
         [](const Paths& p) { return CopyOver(p, 1); }, 0, kOld},
        {"target creation on a full disk (ENOSPC)", false,
         [] {
             Sys().openat = [](int d, const char* p, int f, mode_t m) {
                 return IsTarget(p) ? Fail(ENOSPC) : kReal.openat(d, p, f, m);
             };
         },
         [](const Paths& p) {
             unlink(p.target.c_str());
             return CopyOver(p, 0);
         },
         0, kMissing},
        {"source open fails (EIO)", false,
         [] {
             Sys().openat = [](int d, const char* p, int f, mode_t m) {
                 return IsTarget(p) ? kReal.openat(d, p, f, m) : Fail(EIO);
             };
         },
         [](const Paths& p) { return CopyOver(p, 1); }, 0, kOld},
        {"target directory cannot be made (EROFS)", false,
         [] { Sys().mkdir = [](const char*, mode_t) { return Fail(EROFS); }; },
         [](const Paths& p) {
             return rvCopyFile(p.source.c_str(), (p.target + ".d/target").c_str(), 0, 1, 0, 0, nullptr, nullptr, 0644);
         },
         0, kOld},
        {"source cannot be examined (fstat fails)", false,
         [] { Sys().fstat = [](int, struct stat*) { return Fail(EIO); }; },
         [](const Paths& p) { return CopyOver(p, 1); }, 0, kOld},
        {"up to date: never opened", false,
         [] { Sys().write = [](int, const void*, size_t) -> ssize_t { return Fail(ENOSPC); }; },
         [](const Paths& p) {
             Put(p.target, std::string(kSource.size(), 'x'));
             struct stat info;
             stat(p.source.c_str(), &info);
             const struct timespec times[2] = {info.st_mtim, info.st_mtim};
             utimensat(AT_FDCWD, p.target.c_str(), times, 0);
             return CopyOver(p, 0);
         },
         0, std::string(kSource.size(), 'x')},
        {"read-only directory, new target", true, nullptr,
         [](const Paths& p) {
             return rvCopyFile(p.source.c_str(), (p.readOnly + "/new").c_str(), 0, 0, 0, 0, nullptr, nullptr, 0644);
         },
         0, kOld},

        // A failure after the target is opened removes the target: rvCopyFile
        // leaves no partial copy, and an old target was truncated by then.
        {"full disk: /dev/full behind the target name", false, nullptr,
         [](const Paths& p) {
             unlink(p.target.c_str());
             symlink("/dev/full", p.target.c_str());
             return CopyOver(p, 1);
         },
         0, kMissing},
        {"file size limit, new target", true, [] { LimitFileSize(20000); },
         [](const Paths& p) {
             unlink(p.target.c_str());
             return CopyOver(p, 0);
         },
         0, kMissing},
        {"file size limit, replacing a target", true, [] { LimitFileSize(20000); },
         [](const Paths& p) { return CopyOver(p, 1); }, 0, kMissing},
        {"the source ends early", false,
         [] {
             NoKernelCopy();
             Sys().read = [](int fd, void* buffer, size_t count) -> ssize_t {
                 static int reads = 0;
                 return ++reads == 2 ? 0 : kReal.read(fd, buffer, count);
             };
         },
         [](const Paths& p) { return CopyOver(p, 1, 1); }, 0, kMissing},
        {"the source ends early under the kernel copy", false,
         [] {
             Sys().copy_file_range = [](int from, loff_t*, int to, loff_t*, size_t, unsigned int) -> ssize_t {
                 static int copies = 0;
                 return ++copies == 1 ? kReal.copy_file_range(from, nullptr, to, nullptr, 1000, 0) : 0;
             };
             Sys().read = [](int, void*, size_t) -> ssize_t { return 0; };
         },
         [](const Paths& p) { return CopyOver(p, 1, 1); }, 0, kMissing},
        {"the disk fills under the kernel copy", false,
         [] {
             Sys().copy_file_range = [](int, loff_t*, int, loff_t*, size_t, unsigned int) -> ssize_t {
                 return Fail(ENOSPC);
             };
             Sys().write = [](int, const void*, size_t) -> ssize_t { return Fail(ENOSPC); };
         },
         [](const Paths& p) { return CopyOver(p, 1, 1); }, 0, kMissing},
        {"read fails (EIO)", false,
         [] {
             NoKernelCopy();
             Sys().read = [](int, void*, size_t) -> ssize_t { return Fail(EIO); };
         },
         [](const Paths& p) { return CopyOver(p, 1); }, 0, kMissing},
        {"disk fills after the first block", false,
         [] {
             NoKernelCopy();
             Sys().write = [](int fd, const void* data, size_t count) -> ssize_t {
                 struct stat info;
                 fstat(fd, &info);
                 return info.st_size > 0 ? Fail(ENOSPC) : kReal.write(fd, data, count);
             };
         },
         [](const Paths& p) { return CopyOver(p, 1); }, 0, kMissing},
        {"target fails to close (EIO)", false,
         [] {
             Sys().close = [](int fd) {
                 static int closes = 0;
                 kReal.close(fd);
                 return ++closes == 2 ? Fail(EIO) : 0;  // the source closes first
             };
         },
         [](const Paths& p) { return CopyOver(p, 1); }, 0, kMissing},

        // Where the cleanup itself cannot run, the truncated target stays.
        {"read-only directory, replacing a target past a size limit", true, [] { LimitFileSize(20000); },
         [](const Paths& p) {
             return rvCopyFile(p.source.c_str(), (p.readOnly + "/target").c_str(), 0, 1, 0, 0, nullptr, nullptr, 0644);
         },
         0, kSource.substr(0, 20000)},
        {"the failed copy cannot be removed", false,
         [] {
             NoKernelCopy();
             Sys().write = [](int, const void*, size_t) -> ssize_t { return Fail(ENOSPC); };
             Sys().unlinkat = [](int, const char*, int) { return Fail(EBUSY); };
         },
         [](const Paths& p) { return CopyOver(p, 1); }, 0, ""},

        // The byte loop finishes what the kernel copy leaves, or does it all.
        {"the kernel copy stops part way", false,
         [] {
             Sys().copy_file_range = [](int from, loff_t*, int to, loff_t*, size_t, unsigned int) -> ssize_t {
                 static int copies = 0;
                 return ++copies == 1 ? kReal.copy_file_range(from, nullptr, to, nullptr, 12345, 0) : Fail(EXDEV);
             };
         },
         [](const Paths& p) { return CopyOver(p, 1); }, 1, kSource},
        {"no kernel copy", false, NoKernelCopy, [](const Paths& p) { return CopyOver(p, 1); }, 1, kSource},

        // A move whose source cannot be removed still counts the copy.
        {"move, source stays (EBUSY)", false,
         [] {
             Sys().unlinkat = [](int d, const char* p, int f) {
                 return IsTarget(p) ? kReal.unlinkat(d, p, f) : Fail(EBUSY);
             };
         },
         [](const Paths& p) { return CopyOver(p, 1, 1); }, 1, kSource},

        // WriteFile: a failed write adds nothing; a short one only what fits.
        {"WriteFile on /dev/full", false, nullptr, [](const Paths&) { return Append("/dev/full", "x"); }, -ENOSPC,
         kOld},
        {"WriteFile at a file size limit", true, [] { LimitFileSize(16); },
         [](const Paths& p) { return Append(p.target, "more"); }, -EFBIG, kOld},
        {"WriteFile across a file size limit", true, [] { LimitFileSize(18); },
         [](const Paths& p) { return Append(p.target, "more"); }, 2, kOld + "mo"},
        {"WriteFile fails (EIO)", false,
         [] { Sys().write = [](int, const void*, size_t) -> ssize_t { return Fail(EIO); }; },
         [](const Paths& p) { return Append(p.target, "more"); }, -EIO, kOld},
        {"WriteFile interrupted twice", false,
         [] {
             Sys().write = [](int fd, const void* data, size_t count) -> ssize_t {
                 static int interruptions = 0;
                 return ++interruptions <= 2 ? Fail(EINTR) : kReal.write(fd, data, count);
             };
         },
         [](const Paths& p) { return Append(p.target, "more"); }, 4, kOld + "more"},
    };
    ASSERT_EQ(16u, kOld.size()) << "the size limits above count on it";

    for (const FaultCase& c : cases) {
        SCOPED_TRACE(c.what);
        TempDir dir;
        Paths paths{Put(dir / "source", kSource), Put(dir / "target", kOld), dir / "ro"};
        Put(paths.readOnly + "/target", kOld);
        HandOver(dir.path());
        chmod(paths.readOnly.c_str(), 0555);

        int result;
        if (c.inChild) {
            result = RunInChild(c.fault, c.action, paths);
        } else {
            ScopedSysCalls restore(Sys());
            ScopedSysCalls noPauses(tessaline::util::Sys());
            tessaline::util::Sys().nanosleep = [](const struct timespec*, struct timespec*) { return 0; };
            if (c.fault != nullptr) {
                c.fault();
            }
            result = c.action(paths);
        }
        EXPECT_EQ(c.result, result);
        const bool readOnlyCase = std::strstr(c.what, "read-only") != nullptr;
        EXPECT_EQ(c.target, Slurp(readOnlyCase ? paths.readOnly + "/target" : paths.target));
        EXPECT_EQ(kSource, Slurp(paths.source)) << "the source is never lost";
        EXPECT_EQ(kMissing, Slurp(paths.readOnly + "/new"));
        chmod(paths.readOnly.c_str(), 0755);
    }
    struct stat device;
    EXPECT_EQ(0, stat("/dev/full", &device)) << "the device behind a target name stays";
}
