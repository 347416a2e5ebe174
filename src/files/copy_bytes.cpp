// The byte copy under rvCopyFile.
#include "files/copy_bytes.h"

#include <algorithm>
#include <cstddef>

#include "tessaline/files/rvCopy.h"
#include "tessaline/files/rvFileApi.h"

namespace tessaline::files {
namespace {

constexpr size_t kCopyBufferSize = 0x4000;

void* const kInvalidHandle = reinterpret_cast<void*>(static_cast<intptr_t>(-1));

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

}  // namespace

bool OwnedHandle::IsOpen() const
{
    return m_handle != kInvalidHandle;
}

int OwnedHandle::Close()
{
    if (!IsOpen()) {
        return 1;
    }
    void* handle = m_handle;
    m_handle = kInvalidHandle;
    return CloseHandle(handle);
}

bool CopyBytes(void* from, void* to)
{
    int64_t left = rvGetFileSize64(from);
    if (left < 0) {
        return false;
    }
    char buffer[kCopyBufferSize];
    while (left != 0) {
        const unsigned long want =
            static_cast<unsigned long>(std::min<int64_t>(left, kCopyBufferSize));
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
