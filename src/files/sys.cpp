// The real platform calls behind the file services' seam.
#include "files/sys.h"

#include <fcntl.h>
#include <unistd.h>

namespace tessaline::files {
namespace {

int OpenFile(const char* path, int flags, mode_t mode)
{
    return ::open(path, flags, mode);
}

int StatPath(const char* path, struct stat* info)
{
    return ::stat(path, info);
}

int StatHandle(int fd, struct stat* info)
{
    return ::fstat(fd, info);
}

SysCalls g_sys = {
    OpenFile, ::close, ::read, ::write, ::lseek, StatHandle, StatPath, ::lockf,
    ::access, ::chmod, ::unlink, ::rmdir, ::symlink, ::nanosleep,
    ::opendir, ::readdir, ::closedir, ::pathconf,
};

}  // namespace

SysCalls& Sys()
{
    return g_sys;
}

}  // namespace tessaline::files
