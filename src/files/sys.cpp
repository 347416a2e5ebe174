// The real platform calls behind the file services' seam.
#include "files/sys.h"

#include <dlfcn.h>
#include <errno.h>
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
    OpenFile,       ::close,     ::read,    ::write,    ::copy_file_range, ::lseek,     StatHandle, StatPath,
    ::lockf,        ::access,    ::chmod,   ::mkdir,    ::unlink,          ::rmdir,     ::symlink,  ::realpath,
    StatFileSystem, ::opendir, ::readdir,  ::closedir,        ::pathconf,  OpenFileAt, StatAt,
    ::faccessat,    ::unlinkat,  ::mkdirat, ::fchmodat, ::symlinkat,       ::fdopendir,
};

}  // namespace

SysCalls& Sys()
{
    return g_sys;
}

namespace sys {

int Stat(const char* path, struct stat* info)
{
    return Sys().stat(path, info);
}

int Access(const char* path, int mode)
{
    return Sys().access(path, mode);
}

int MakeDirectory(const char* path, mode_t mode)
{
    return Sys().mkdir(path, mode);
}

char* ResolvePath(const char* path, char* resolved)
{
    return Sys().realpath(path, resolved);
}

int FileSystemStatus(const char* path, struct statfs* info)
{
    return Sys().statfs(path, info);
}

void* OpenLibrary(const char* name, int mode)
{
    return ::dlopen(name, mode);
}

int CloseLibrary(void* handle)
{
    return ::dlclose(handle);
}

void* LibrarySymbol(void* handle, const char* symbol)
{
    return ::dlsym(handle, symbol);
}

void DiscardLibraryError()
{
    int saved = errno;
    ::dlerror();
    errno = saved;
}

}  // namespace sys

}  // namespace tessaline::files
