// The real platform calls behind the configuration store's seam.
#include "config/sys.h"

#include <cerrno>
#include <cstring>
#include <string>

#include <fcntl.h>
#include <unistd.h>

namespace tessaline::config {

namespace {

int OpenFile(const char* path, int flags, mode_t mode)
{
    return ::open(path, flags, mode);
}

int StatPath(const char* path, struct stat* info)
{
    return ::stat(path, info);
}

// The library's own streams have one user at a time: the unlocked forms.
SysCalls g_sys = {
    ::fopen, ::fdopen, ::fgets_unlocked, ::ferror_unlocked, ::fwrite_unlocked, ::fflush,   ::fclose, OpenFile, ::close,
    ::fsync, ::fchmod, ::fchown,         StatPath,          ::access,          ::readlink, ::rename, ::link,   ::unlink,
};

}  // namespace

SysCalls& Sys()
{
    return g_sys;
}

namespace sys {

FILE* CreateStream(const char* name, mode_t mode)
{
    if (Sys().unlink(name) != 0 && errno != ENOENT) {
        return nullptr;
    }
    const int fd = Sys().open(name, O_RDWR | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, mode);
    if (fd < 0) {
        return nullptr;
    }
    FILE* stream = Sys().fdopen(fd, "w+");
    if (stream == nullptr) {
        const int error = errno;
        Sys().close(fd);
        errno = error;
    }
    return stream;
}

bool Write(FILE* stream, const char* text, std::size_t length)
{
    return Sys().fwrite(text, 1, length, stream) == length;
}

bool CloseSynced(FILE* stream)
{
    const bool good = Sys().fflush(stream) == 0 && Sys().fsync(fileno(stream)) == 0;
    const int saved = errno;
    if (Sys().fclose(stream) != 0) {
        return false;
    }
    errno = saved;
    return good;
}

void SyncDirectory(const char* path)
{
    const char* slash = std::strrchr(path, '/');
    const std::string directory = slash == nullptr ? std::string(".")
                                  : slash == path  ? std::string("/")
                                                   : std::string(path, slash - path);
    const int saved = errno;
    const int fd = Sys().open(directory.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC, 0);
    if (fd >= 0) {
        Sys().fsync(fd);
        Sys().close(fd);
    }
    errno = saved;
}

}  // namespace sys

}  // namespace tessaline::config
