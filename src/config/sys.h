// The configuration store's calls to the platform that can fail. Each
// leaves errno as the failing call set it.
#ifndef TESSALINE_SRC_CONFIG_SYS_H
#define TESSALINE_SRC_CONFIG_SYS_H

#include <cstddef>
#include <cstdio>

namespace tessaline::config::sys {

// fopen; the mode carries "e" for the library's own streams.
FILE* OpenStream(const char* name, const char* mode);

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
int Unlink(const char* path);

}  // namespace tessaline::config::sys

#endif
