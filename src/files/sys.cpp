// The real platform calls behind the file services' seam.
#include "files/sys.h"

#include <dlfcn.h>
#include <fcntl.h>
#include <stdlib.h>
#include <unistd.h>

namespace tessaline::files {
namespace {

int OpenFile(const char* path, int flags, mode_t mode)
{
    return ::open(path, flags, mode);
}

int OpenFileAt(int directory, const char* path, int flags, mode_t mode)
{
    return ::openat(directory, path, flags, mode);
}

int StatAt(int directory, const char* path, struct stat* info, int flags)
{
    return ::fstatat(directory, path, info, flags);
}

int StatPath(const char* path, struct stat* info)
{
    return ::stat(path, info);
}

int StatHandle(int fd, struct stat* info)
{
    return ::fstat(fd, info);
}

int StatFileSystem(const char* path, struct statfs* info)
{
    return ::statfs(path, info);
}

SysCalls g_sys = {
    OpenFile,    ::close,    ::read,         ::write,    ::copy_file_range, ::lseek,    StatHandle,
    StatPath,    ::lockf,    ::access,       ::chmod,    ::mkdir,           ::unlink,   ::rmdir,
    ::symlink,   ::realpath, StatFileSystem, ::opendir,  ::readdir,         ::closedir, ::pathconf,
    OpenFileAt,  StatAt,     ::faccessat,    ::unlinkat, ::mkdirat,         ::fchmodat, ::symlinkat,
    ::fdopendir, ::dlopen,   ::dlclose,      ::dlsym,    ::dlerror,
};

}  // namespace

SysCalls& Sys()
{
    return g_sys;
}

}  // namespace tessaline::files
