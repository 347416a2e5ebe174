// The configuration store's calls to the platform that can fail. Each
// leaves errno as the failing call set it.
#ifndef TESSALINE_SRC_CONFIG_SYS_H
#define TESSALINE_SRC_CONFIG_SYS_H

#include <cstddef>
#include <cstdio>

namespace tessaline::config::sys {

// fopen; the mode carries "e" for the library's own streams.
FILE* OpenStream(const char* name, const char* mode);

// Writes all of `text`; false on a short write.
bool Write(FILE* stream, const char* text, std::size_t length, const char* name);

// Flushes the stream, syncs the file to disk and closes it; false if any
// step failed. The stream is closed in every case.
bool CloseSynced(FILE* stream, const char* name);

// Syncs the directory that holds `path`, so that a rename in it is durable.
bool SyncDirectoryOf(const char* path);

int Rename(const char* from, const char* to);
int Unlink(const char* path);

}  // namespace tessaline::config::sys

#endif
