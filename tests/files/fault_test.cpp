// A full disk, a file size limit and failing calls during rvCopyFile and
// WriteFile: each case gives its result and leaves the files as listed.
#include <algorithm>
#include <climits>
#include <vector>

#include "files/file_fixtures.h"
#include "files/sys.h"
#include "support/scoped_sys_calls.h"
#include "tessaline/files/rvCopy.h"
#include "tessaline/files/rvFileApi.h"
#include "util/sys.h"

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

const SysCalls kReal = Sys();

bool IsTarget(const char* path)
{
    const size_t length = std::strlen(path);
    return length >= 6 && std::strcmp(path + length - 6, "target") == 0;
}

// clang-format off
enum Call { kOpenTarget, kOpenSource, kMkdir, kFstat, kCopyRange, kRead, kWrite, kClose, kUnlinkTarget, kUnlinkSource,
            kCalls };
// clang-format on
constexpr int kReally = INT_MAX;

// From its `from`th call on, `call` fails with errno -result, or, where
// result >= 0, runs for real with its byte count cut to result. A later
// fault for the same call takes over from an earlier one.
struct Fault {
    Call call;
    int from;
    int result;
};

std::vector<Fault> g_faults;
int g_counts[kCalls];

// Whether this call of `call` fails (errno set); else cuts `*count`.
bool Failing(Call call, size_t* count = nullptr)
{
    const int number = ++g_counts[call];
    int result = kReally;
    for (const Fault& fault : g_faults) {
        if (fault.call == call && number >= fault.from) {
            result = fault.result;
        }
    }
    if (result < 0) {
        errno = -result;
        return true;
    }
    if (count != nullptr) {
        *count = std::min<size_t>(*count, result);
    }
    return false;
}

void Script(const std::vector<Fault>& faults)
{
    g_faults = faults;
    std::fill(std::begin(g_counts), std::end(g_counts), 0);
    Sys().openat = [](int d, const char* p, int f, mode_t m) {
        return Failing(IsTarget(p) ? kOpenTarget : kOpenSource) ? -1 : kReal.openat(d, p, f, m);
    };
    Sys().mkdir = [](const char* p, mode_t m) { return Failing(kMkdir) ? -1 : kReal.mkdir(p, m); };
    Sys().fstat = [](int fd, struct stat* info) { return Failing(kFstat) ? -1 : kReal.fstat(fd, info); };
    Sys().copy_file_range = [](int from, loff_t*, int to, loff_t*, size_t n, unsigned int) -> ssize_t {
        return Failing(kCopyRange, &n) ? -1 : kReal.copy_file_range(from, nullptr, to, nullptr, n, 0);
    };
    Sys().read = [](int fd, void* data, size_t n) -> ssize_t {
        return Failing(kRead, &n) ? -1 : kReal.read(fd, data, n);
    };
    Sys().write = [](int fd, const void* data, size_t n) -> ssize_t {
        return Failing(kWrite, &n) ? -1 : kReal.write(fd, data, n);
    };
    Sys().close = [](int fd) {
        const int closed = kReal.close(fd);
        return Failing(kClose) ? -1 : closed;
    };
    Sys().unlinkat = [](int d, const char* p, int f) {
        return Failing(IsTarget(p) ? kUnlinkTarget : kUnlinkSource) ? -1 : kReal.unlinkat(d, p, f);
    };
}

// WriteFile of "more" at the end of `path`: the count written, or -errno.
int Append(const std::string&, const std::string& path)
{
    void* handle = CreateFile(path.c_str(), O_WRONLY | O_APPEND | O_CLOEXEC, 0, nullptr, 0, 0, nullptr);
    unsigned long done = 0;
    const int ok = WriteFile(handle, "more", 4, &done, nullptr);
    const int error = errno;
    CloseHandle(handle);
    if (ok == 0) {
        EXPECT_EQ(ULONG_MAX, done) << "a failed write reports -1 as its count";
        return -error;
    }
    return static_cast<int>(done);
}

using Action = int (*)(const std::string& source, const std::string& target);
const Action kReplace = [](const std::string& s, const std::string& t) {
    return rvCopyFile(s.c_str(), t.c_str(), 0, 1, 0, 0, nullptr, nullptr, 0644);
};
const Action kMove = [](const std::string& s, const std::string& t) {
    return rvCopyFile(s.c_str(), t.c_str(), 0, 1, 0, 1, nullptr, nullptr, 0644);
};
const Action kIntoNewDirectory = [](const std::string& s, const std::string& t) {
    return kReplace(s, t + ".d/target");
};
const Action kFromMissing = [](const std::string& s, const std::string& t) { return kReplace(s + ".gone", t); };
const Action kOverDevFull = [](const std::string& s, const std::string& t) {
    unlink(t.c_str());
    symlink("/dev/full", t.c_str());
    return kReplace(s, t);
};

struct FaultCase {
    const char* what;
    std::vector<Fault> faults;
    Action action;
    int result;
    std::string target;  // what the target holds afterwards
};

}  // namespace

TEST(FaultInjection, OldDataAndResultsUnderFailures)
{
    // clang-format off
    const FaultCase cases[] = {
        // Failures before the target is opened leave it byte for byte.
        {"target open refused (EACCES)", {{kOpenTarget, 1, -EACCES}}, kReplace, 0, kOld},
        {"missing source", {}, kFromMissing, 0, kOld},
        {"source open fails (EIO)", {{kOpenSource, 1, -EIO}}, kReplace, 0, kOld},
        {"source opens at the second attempt", {{kOpenSource, 1, -EAGAIN}, {kOpenSource, 2, kReally}}, kReplace, 1,
         kSource},
        {"target directory cannot be made (EROFS)", {{kMkdir, 1, -EROFS}}, kIntoNewDirectory, 0, kOld},
        {"source cannot be examined (fstat fails)", {{kFstat, 1, -EIO}}, kReplace, 0, kOld},

        // A failure after the target is opened removes the target: rvCopyFile
        // leaves no partial copy, and an old target was truncated by then.
        {"full disk: /dev/full behind the target name", {}, kOverDevFull, 0, kMissing},
        {"file size limit: a short write, then EFBIG",
         {{kCopyRange, 1, -EXDEV}, {kWrite, 1, 1000}, {kWrite, 2, -EFBIG}}, kReplace, 0, kMissing},
        {"the source ends early", {{kCopyRange, 1, -EXDEV}, {kRead, 2, 0}}, kMove, 0, kMissing},
        {"read fails (EIO)", {{kCopyRange, 1, -EXDEV}, {kRead, 1, -EIO}}, kReplace, 0, kMissing},
        {"target fails to close (EIO)", {{kClose, 2, -EIO}}, kReplace, 0, kMissing},  // the source closes first
        // Where the cleanup itself cannot run, the truncated target stays.
        {"the failed copy cannot be removed",
         {{kCopyRange, 1, -EXDEV}, {kWrite, 1, -ENOSPC}, {kUnlinkTarget, 1, -EBUSY}}, kReplace, 0, ""},

        // The byte loop finishes what the kernel copy leaves, or does it all.
        {"the kernel copy stops part way",
         {{kCopyRange, 1, 12345}, {kCopyRange, 2, -EXDEV}}, kReplace, 1, kSource},
        {"no kernel copy", {{kCopyRange, 1, -EXDEV}}, kReplace, 1, kSource},
        // A move whose source cannot be removed still counts the copy.
        {"move, source stays (EBUSY)", {{kUnlinkSource, 1, -EBUSY}}, kMove, 1, kSource},

        // WriteFile: a failed write adds nothing; a short one only what fits.
        {"WriteFile fails (EIO)", {{kWrite, 1, -EIO}}, Append, -EIO, kOld},
        {"WriteFile across a file size limit", {{kWrite, 1, 2}, {kWrite, 2, -EFBIG}}, Append, 2, kOld + "mo"},
        {"WriteFile interrupted twice",
         {{kWrite, 1, -EINTR}, {kWrite, 3, kReally}}, Append, 4, kOld + "more"},
    };
    // clang-format on

    for (const FaultCase& c : cases) {
        SCOPED_TRACE(c.what);
        TempDir dir;
        const std::string source = Put(dir / "source", kSource);
        const std::string target = Put(dir / "target", kOld);
        ScopedSysCalls restore(Sys());
        ScopedSysCalls noPauses(tessaline::util::Sys());
        tessaline::util::Sys().nanosleep = [](const struct timespec*, struct timespec*) { return 0; };
        Script(c.faults);
        const int result = c.action(source, target);
        EXPECT_EQ(c.result, result);
        EXPECT_EQ(c.target, Slurp(target));
        EXPECT_EQ(kSource, Slurp(source)) << "the source is never lost";
    }
    struct stat device;
    EXPECT_EQ(0, stat("/dev/full", &device)) << "the device behind a target name stays";
}
