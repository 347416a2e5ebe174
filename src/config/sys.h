// The configuration store's calls to the platform that can fail. Each
// leaves errno as the failing call set it.
#ifndef TESSALINE_SRC_CONFIG_SYS_H
#define TESSALINE_SRC_CONFIG_SYS_H

#include <cstddef>
#include <cstdio>

namespace tessaline::config::sys {

// fopen; the mode carries "e" for the library's own streams.
FILE* OpenStream(const char* name, const char* mode);

// Creates `name` afresh for writing and reading, close-on-exec: a file or
// symbolic link already standing there is removed first, and the open
// refuses to follow or reuse one planted meanwhile. `mode` is that of
// open(2), before the umask.
FILE* CreateStream(const char* name, unsigned int mode);

// The permission bits of `path` (following links); false if it cannot be
// examined.
bool PermissionBits(const char* path, unsigned int* bits);

// fchmod of the stream's file.
bool SetPermissionBits(FILE* stream, unsigned int bits);

// access() with F_OK and W_OK.
bool Exists(const char* path);
bool Writable(const char* path);

// Writes all of `text`; false on a short write.
bool Write(FILE* stream, const char* text, std::size_t length, const char* name);

// Flushes the stream, syncs the file to disk and closes it; false if any
// step failed. The stream is closed in every case.
bool CloseSynced(FILE* stream, const char* name);

// Syncs the directory that holds `path`, so that a new name or a rename in
// it is durable. Best effort: some file systems cannot sync a directory, and
// the file itself is complete by then.
void SyncDirectory(const char* path);

int Rename(const char* from, const char* to);
// A rename whose target exists and is replaced in one step.
int Replace(const char* from, const char* to);
// A second name for the file `from`.
int Link(const char* from, const char* to);
int Unlink(const char* path);

}  // namespace tessaline::config::sys

#endif
