// The platform calls of the files subsystem, routed through one table so
// that tests can make any of them fail on demand. The library reads the table
// on every call; a test swaps entries under a testing::ScopedSysCalls
// (tests/support/scoped_sys_calls.h). Not part of the installed interface.
//
// Each call returns what the platform call returns and leaves its errno
// untouched, so callers read the cause of a failure right after the call.
#ifndef TESSALINE_SRC_FILES_SYS_H
#define TESSALINE_SRC_FILES_SYS_H

#include <dirent.h>
#include <sys/stat.h>
#include <sys/types.h>
#include <sys/vfs.h>
#include <time.h>

namespace tessaline::files {

struct SysCalls {
    int (*open)(const char* path, int flags, mode_t mode);
    int (*close)(int fd);
    ssize_t (*read)(int fd, void* buffer, size_t count);
    ssize_t (*write)(int fd, const void* buffer, size_t count);
    // Kernel-side copy between the current offsets of two descriptors.
    ssize_t (*copy_file_range)(int from, loff_t* fromOffset, int to, loff_t* toOffset, size_t count,
                               unsigned int flags);
    off_t (*lseek)(int fd, off_t offset, int whence);
    int (*fstat)(int fd, struct stat* info);
    int (*stat)(const char* path, struct stat* info);
    int (*lockf)(int fd, int command, off_t length);
    int (*access)(const char* path, int mode);
    int (*chmod)(const char* path, mode_t mode);
    int (*mkdir)(const char* path, mode_t mode);
    int (*unlink)(const char* path);
    int (*rmdir)(const char* path);
    int (*symlink)(const char* existing, const char* created);
    // realpath into a caller's area of PATH_MAX bytes.
    char* (*realpath)(const char* path, char* resolved);
    int (*statfs)(const char* path, struct statfs* info);
    DIR* (*opendir)(const char* path);
    struct dirent* (*readdir)(DIR* dir);
    int (*closedir)(DIR* dir);
    long (*pathconf)(const char* path, int name);
    // The same calls relative to an open directory, for the tree walks.
    int (*openat)(int directory, const char* path, int flags, mode_t mode);
    int (*fstatat)(int directory, const char* path, struct stat* info, int flags);
    int (*faccessat)(int directory, const char* path, int mode, int flags);
    int (*unlinkat)(int directory, const char* path, int flags);
    int (*mkdirat)(int directory, const char* path, mode_t mode);
    int (*fchmodat)(int directory, const char* path, mode_t mode, int flags);
    int (*symlinkat)(const char* existing, int directory, const char* created);
    DIR* (*fdopendir)(int fd);
    // The dynamic loader.
    void* (*dlopen)(const char* name, int mode);
    int (*dlclose)(void* handle);
    void* (*dlsym)(void* handle, const char* symbol);
    char* (*dlerror)();
};

// The live table. Tests reach it by linking the library's objects
// statically; the shared object does not export it.
SysCalls& Sys();

}  // namespace tessaline::files

#endif
