// The plain-named path functions.
#include <errno.h>
#include <limits.h>
#include <string.h>
#include <unistd.h>

#include "files/path_limits.h"
#include "files/sys.h"
#include "tessaline/files/rvFilename.h"
#include "tessaline/files/rvPath.h"

namespace {

using tessaline::files::Sys;

constexpr mode_t kNewDirectoryMode = 06775;

// Copies at most `length` - 1 characters, zero-filling the rest of `out`.
// `text` may overlap `out`.
void CopyCut(char* out, const char* text, size_t length)
{
    size_t copied = strnlen(text, length - 1);
    memmove(out, text, copied);
    memset(out + copied, 0, length - copied);
}

}  // namespace

int CreateDir(const char* path, long extra)
{
    if (!path) {
        path = "";
    }
    if (Sys().access(path, F_OK) == 0) {
        return 1;
    }
    if (errno != ENOENT) {
        return 0;
    }

    rvFilename name(path, 0);
    rvFilename parent(name.Directory(), 0);
    // The walk ends where the directory of a name is the name itself.
    if (!(parent == name) && !CreateDir(name.Directory(), extra)) {
        return 0;
    }
    // A name with a trailing "/" is its own parent and exists by now.
    if (Sys().access(path, F_OK) == 0) {
        return 1;
    }
    return Sys().mkdir(path, kNewDirectoryMode) == 0 ? 1 : 0;
}

char* GetFullDirectoryName(const char* path, char* out, unsigned int length)
{
    if (!out || length == 0) {
        return out;
    }
    if (!path) {
        path = "";
    }
    // Resolved before `out` is written, since the two may be one buffer.
    char resolved[tessaline::files::kPathWorkArea];
    const char* full = Sys().realpath(path, resolved) ? resolved : path;
    CopyCut(out, full, length);
    return out;
}

int FileExists(const char* path)
{
    struct stat info;
    return Sys().stat(path ? path : "", &info) == 0 ? 1 : 0;
}

long long DiskFreeSpace(const char* path)
{
    struct statfs info;
    if (Sys().statfs(path ? path : "", &info) != 0) {
        return 0;
    }
    long long bytes = 0;
    if (__builtin_mul_overflow(info.f_bavail, info.f_bsize, &bytes)) {
        return LLONG_MAX;
    }
    return bytes;
}
