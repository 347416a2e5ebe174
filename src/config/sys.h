// The platform calls of the configuration store, routed through one table so
// that tests can make any of them fail on demand. The library reads the table
// on every call; a test swaps entries under a testing::ScopedSysCalls
// (tests/support/scoped_sys_calls.h). Not part of the installed interface.
//
// Each entry returns what the platform call returns and leaves its errno
// untouched, so callers read the cause of a failure right after the call.
#ifndef TESSALINE_SRC_CONFIG_SYS_H
#define TESSALINE_SRC_CONFIG_SYS_H

#include <cstddef>
#include <cstdio>

#include <sys/stat.h>
#include <sys/types.h>

namespace tessaline::config {

struct SysCalls {
    FILE* (*fopen)(const char* path, const char* mode);
    FILE* (*fdopen)(int fd, const char* mode);
    // Every line the reading and the writing pass take from the old file.
    char* (*fgets)(char* line, int size, FILE* stream);
    int (*ferror)(FILE* stream);
    // fwrite without the stream's lock: the temporary file is the writer's own.
    size_t (*fwrite)(const void* data, size_t size, size_t count, FILE* stream);
    int (*fflush)(FILE* stream);
    int (*fclose)(FILE* stream);
    int (*open)(const char* path, int flags, mode_t mode);
    int (*close)(int fd);
    int (*fsync)(int fd);
    int (*fchmod)(int fd, mode_t mode);
    int (*fchown)(int fd, uid_t owner, gid_t group);
    int (*stat)(const char* path, struct stat* info);
    int (*access)(const char* path, int mode);
    ssize_t (*readlink)(const char* path, char* target, size_t size);
    int (*rename)(const char* from, const char* to);
    int (*link)(const char* existing, const char* created);
    int (*unlink)(const char* path);
};

// The live table. Tests reach it by linking the library's objects
// statically; the shared object does not export it.
SysCalls& Sys();

namespace sys {

// Creates `name` afresh for writing and reading, close-on-exec: a file or
// symbolic link already standing there is removed first, and the open
// refuses to follow or reuse one planted meanwhile. `mode` is that of
// open(2), before the umask.
FILE* CreateStream(const char* name, mode_t mode);

// Writes all of `text`; false on a short write.
bool Write(FILE* stream, const char* text, std::size_t length);

// Flushes the stream, syncs the file to disk and closes it; false if any
// step failed. The stream is closed in every case.
bool CloseSynced(FILE* stream);

// Syncs the directory that holds `path`, so that a new name or a rename in
// it is durable. Best effort: some file systems cannot sync a directory, and
// the file itself is complete by then.
void SyncDirectory(const char* path);

}  // namespace sys

}  // namespace tessaline::config

#endif
