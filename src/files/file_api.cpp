// The handle-based file calls.
#include "tessaline/files/rvFileApi.h"

#include <cerrno>
#include <climits>
#include <cstring>

#include <fcntl.h>
#include <unistd.h>

#include "files/handle.h"
#include "files/open_at.h"
#include "files/sys.h"
#include "tessaline/util/rvString.h"
#include "util/error_text.h"
#include "util/sys.h"

using tessaline::files::Descriptor;
using tessaline::files::Handle;
using tessaline::files::Sys;

namespace {

// The 32-bit platform's O_LARGEFILE; set on every open as the interface
// always did. The kernel treats it as implied on x86-64.
constexpr int kLargeFileFlag = 0x8000;
constexpr int kOpenAttempts = 3;
constexpr unsigned long kLastErrorSelector = 0xFFFFFFFFul;
constexpr uint64_t kLowHalf = 0xFFFFFFFFull;

// One attempt: `open` repeated at once while a signal interrupts it.
template <typename Open>
int OpenRetryingInterrupts(Open open)
{
    int fd;
    do {
        fd = open();
    } while (fd < 0 && errno == EINTR);
    return fd;
}

// One read or write, repeated while a signal interrupts it.
template <typename Transfer>
int TransferRetryingInterrupts(unsigned long* done, Transfer transfer)
{
    ssize_t result;
    do {
        result = transfer();
    } while (result < 0 && errno == EINTR);
    if (done != nullptr) {
        *done = static_cast<unsigned long>(result);
    }
    return result == -1 ? 0 : 1;
}

// The attempts and pauses of CreateFile around any way of opening.
template <typename Open>
void* OpenWithAttempts(Open open)
{
    for (int attempt = 0; attempt < kOpenAttempts; ++attempt) {
        const int fd = OpenRetryingInterrupts(open);
        if (fd >= 0) {
            return Handle(fd);
        }
        const int error = errno;
        if (error == EEXIST) {
            break;
        }
        if (error == ENOENT || error == 0) {
            tessaline::util::PauseOneSecond();
            errno = error;
        }
    }
    return tessaline::files::InvalidHandle();
}

}  // namespace

namespace tessaline::files {

void* CreateFileAt(int directory, const char* name, int access, int disposition, int mode)
{
    const int flags = access | disposition | kLargeFileFlag;
    return OpenWithAttempts([&] { return Sys().openat(directory, name, flags, static_cast<mode_t>(mode)); });
}

}  // namespace tessaline::files

void* CreateFile(const char* path, int access, int /*share*/, void* /*security*/, int disposition, int mode,
                 void* /*templateFile*/)
{
    const int flags = access | disposition | kLargeFileFlag;
    return OpenWithAttempts([&] { return Sys().open(path, flags, static_cast<mode_t>(mode)); });
}

int CloseHandle(void* handle)
{
    return Sys().close(Descriptor(handle)) == 0 ? 1 : 0;
}

int ReadFile(void* handle, void* buffer, unsigned long count, unsigned long* done, void* /*overlapped*/)
{
    return TransferRetryingInterrupts(done, [&] { return Sys().read(Descriptor(handle), buffer, count); });
}

int WriteFile(void* handle, const void* buffer, unsigned long count, unsigned long* done, void* /*overlapped*/)
{
    return TransferRetryingInterrupts(done, [&] { return Sys().write(Descriptor(handle), buffer, count); });
}

int64_t GetFileSize64(void* handle)
{
    struct stat info;
    if (Sys().fstat(Descriptor(handle), &info) != 0) {
        return -1;
    }
    return static_cast<int64_t>(info.st_size);
}

unsigned long GetFileSize(void* handle, unsigned long* high)
{
    const uint64_t size = static_cast<uint64_t>(GetFileSize64(handle));
    if (high != nullptr) {
        *high = static_cast<unsigned long>(size >> 32);
    }
    return static_cast<unsigned long>(size & kLowHalf);
}

int64_t SetFilePointer64(void* handle, int64_t offset, int whence)
{
    return static_cast<int64_t>(Sys().lseek(Descriptor(handle), static_cast<off_t>(offset), whence));
}

int Lock(void* handle, int wait)
{
    return Sys().lockf(Descriptor(handle), wait != 0 ? F_LOCK : F_TEST, 0) == 0 ? 1 : 0;
}

int Unlock(void* handle)
{
    return Sys().lockf(Descriptor(handle), F_ULOCK, 0) == 0 ? 1 : 0;
}

int GetLastError()
{
    return errno;
}

char* GetLastErrorText(char* buffer, unsigned long size, unsigned long error)
{
    const int code = (error & kLowHalf) == kLastErrorSelector ? GetLastError() : static_cast<int>(error);
    const char* text = tessaline::util::ErrorText(code);
    if (text == nullptr) {
        text = "undefined.";
    }
    if (buffer == nullptr) {
        return const_cast<char*>(text);
    }
    rv_safe_strcpy(buffer, text, size > UINT_MAX ? UINT_MAX : static_cast<unsigned>(size));
    return buffer;
}
