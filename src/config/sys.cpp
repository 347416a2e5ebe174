// System calls of the configuration store, with the test seam.
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <string>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include "config/sys.h"
#include "config/sys_seam.h"

namespace tessaline::config {

namespace {

using testing::SysCall;

testing::FaultHook g_faultHook = nullptr;

// True when the seam says the call fails; errno is set then.
bool injectedFault(SysCall call, const char* path)
{
    const testing::FaultHook hook = __atomic_load_n(&g_faultHook, __ATOMIC_ACQUIRE);
    if (hook == nullptr) {
        return false;
    }
    const int error = hook(call, path);
    if (error == 0) {
        return false;
    }
    errno = error;
    return true;
}

// The seam tells the renames apart by what they replace.
int renameAs(SysCall call, const char* from, const char* to)
{
    return injectedFault(call, from) ? -1 : std::rename(from, to);
}

}  // namespace

void testing::SetFaultHook(FaultHook hook)
{
    __atomic_store_n(&g_faultHook, hook, __ATOMIC_RELEASE);
}

FILE* sys::OpenStream(const char* name, const char* mode)
{
    if (injectedFault(SysCall::Open, name)) {
        return nullptr;
    }
    return std::fopen(name, mode);
}

FILE* sys::CreateStream(const char* name, unsigned int mode)
{
    if (injectedFault(SysCall::Open, name)) {
        return nullptr;
    }
    if (unlink(name) != 0 && errno != ENOENT) {
        return nullptr;
    }
    const int fd = open(name, O_RDWR | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, static_cast<mode_t>(mode));
    if (fd < 0) {
        return nullptr;
    }
    FILE* stream = fdopen(fd, "w+");
    if (stream == nullptr) {
        const int error = errno;
        close(fd);
        errno = error;
    }
    return stream;
}

bool sys::PermissionBits(const char* path, unsigned int* bits)
{
    struct stat status;
    if (stat(path, &status) != 0) {
        return false;
    }
    *bits = status.st_mode & 07777;
    return true;
}

bool sys::SetPermissionBits(FILE* stream, unsigned int bits)
{
    return fchmod(fileno(stream), static_cast<mode_t>(bits)) == 0;
}

bool sys::Exists(const char* path)
{
    return !injectedFault(SysCall::Exists, path) && access(path, F_OK) == 0;
}

bool sys::Writable(const char* path)
{
    return !injectedFault(SysCall::Writable, path) && access(path, W_OK) == 0;
}

bool sys::Write(FILE* stream, const char* text, std::size_t length, const char* name)
{
    if (injectedFault(SysCall::Write, name)) {
        return false;
    }
    // The stream is the writer's own temporary file: no other thread uses it.
    return fwrite_unlocked(text, 1, length, stream) == length;
}

bool sys::CloseSynced(FILE* stream, const char* name)
{
    bool good = !injectedFault(SysCall::Write, name) && std::fflush(stream) == 0;
    good = good && !injectedFault(SysCall::Sync, name) && fsync(fileno(stream)) == 0;
    const int saved = errno;
    if (injectedFault(SysCall::Close, name)) {
        std::fclose(stream);
        return false;
    }
    if (std::fclose(stream) != 0) {
        return false;
    }
    errno = saved;
    return good;
}

void sys::SyncDirectory(const char* path)
{
    const char* slash = std::strrchr(path, '/');
    const std::string directory = slash == nullptr ? std::string(".")
                                  : slash == path  ? std::string("/")
                                                   : std::string(path, slash - path);
    const int saved = errno;
    const int fd = open(directory.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    if (fd >= 0) {
        fsync(fd);
        close(fd);
    }
    errno = saved;
}

int sys::Rename(const char* from, const char* to)
{
    return renameAs(SysCall::Rename, from, to);
}

int sys::Replace(const char* from, const char* to)
{
    return renameAs(SysCall::Replace, from, to);
}

int sys::Link(const char* from, const char* to)
{
    if (injectedFault(SysCall::Link, from)) {
        return -1;
    }
    return link(from, to);
}

int sys::Unlink(const char* path)
{
    if (injectedFault(SysCall::Unlink, path)) {
        return -1;
    }
    return unlink(path);
}

}  // namespace tessaline::config
