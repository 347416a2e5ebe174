// The byte copy under rvCopyFile.
#include "files/copy_bytes.h"

#include <algorithm>
#include <cerrno>
#include <cstddef>
#include <cstdint>

#include "files/handle.h"
#include "files/sys.h"
#include "tessaline/files/rvFileApi.h"

namespace tessaline::files {
namespace {

constexpr size_t kCopyBufferSize = 0x4000;
// Large enough that the kernel copy of a big file takes few calls, small
// enough for every file system's limit on one call.
constexpr int64_t kKernelCopyChunk = int64_t{1} << 30;

// Writes all of `count` bytes, completing short writes.
bool WriteAll(void* handle, const char* data, unsigned long count)
{
    while (count > 0) {
        unsigned long written = 0;
        if (WriteFile(handle, data, count, &written, nullptr) == 0 || written == 0) {
            return false;
        }
        data += written;
        count -= written;
    }
    return true;
}

// Lets the kernel move as much of `*left` as it will, from the current offset
// of one file to that of the other, and takes it off `*left`. The kernel copy
// never decides the outcome: where it stops (a file system that cannot do it,
// a device, a source that ends early, a full disk), the byte loop carries on
// from the same offsets and gives exactly the results and failures it always
// gives, errno included.
void CopyInKernel(void* from, void* to, int64_t* left)
{
    const int savedErrno = errno;
    while (*left > 0) {
        const auto chunk = static_cast<size_t>(std::min(*left, kKernelCopyChunk));
        const ssize_t moved = Sys().copy_file_range(Descriptor(from), nullptr, Descriptor(to), nullptr, chunk, 0);
        if (moved < 0 && errno == EINTR) {
            continue;
        }
        if (moved <= 0) {
            break;
        }
        *left -= moved;
    }
    errno = savedErrno;
}

}  // namespace

bool CopyBytes(void* from, void* to, int64_t size)
{
    int64_t left = size;
    CopyInKernel(from, to, &left);
    char buffer[kCopyBufferSize];
    while (left != 0) {
        const unsigned long want = static_cast<unsigned long>(std::min<int64_t>(left, kCopyBufferSize));
        unsigned long got = 0;
        if (ReadFile(from, buffer, want, &got, nullptr) == 0 || got == 0) {
            return false;
        }
        if (!WriteAll(to, buffer, got)) {
            return false;
        }
        left -= static_cast<int64_t>(got);
    }
    return true;
}

}  // namespace tessaline::files
