// The platform calls of the files subsystem. Each returns what the platform
// call returns and leaves its errno untouched, so callers read the cause of a
// failure right after the call.
#ifndef TESSALINE_SRC_FILES_SYS_H
#define TESSALINE_SRC_FILES_SYS_H

#include <sys/stat.h>
#include <sys/types.h>
#include <sys/vfs.h>

namespace tessaline::files::sys {

int Stat(const char* path, struct stat* info);
int Access(const char* path, int mode);
int MakeDirectory(const char* path, mode_t mode);
// realpath into a caller's area of PATH_MAX bytes.
char* ResolvePath(const char* path, char* resolved);
int FileSystemStatus(const char* path, struct statfs* info);

void* OpenLibrary(const char* name, int mode);
int CloseLibrary(void* handle);
void* LibrarySymbol(void* handle, const char* symbol);
// Clears the loader's pending message, keeping errno.
void DiscardLibraryError();

}  // namespace tessaline::files::sys

#endif
