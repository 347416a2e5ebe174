#include "files/sys.h"

#include <dlfcn.h>
#include <errno.h>
#include <stdlib.h>
#include <unistd.h>

namespace tessaline::files::sys {

int Stat(const char* path, struct stat* info) { return ::stat(path, info); }

int Access(const char* path, int mode) { return ::access(path, mode); }

int MakeDirectory(const char* path, mode_t mode) { return ::mkdir(path, mode); }

char* ResolvePath(const char* path, char* resolved) { return ::realpath(path, resolved); }

int FileSystemStatus(const char* path, struct statfs* info) { return ::statfs(path, info); }

void* OpenLibrary(const char* name, int mode) { return ::dlopen(name, mode); }

int CloseLibrary(void* handle) { return ::dlclose(handle); }

void* LibrarySymbol(void* handle, const char* symbol) { return ::dlsym(handle, symbol); }

void DiscardLibraryError()
{
    int saved = errno;
    ::dlerror();
    errno = saved;
}

}  // namespace tessaline::files::sys
