// The plain-named path functions.
#include <errno.h>
#include <limits.h>
#include <string.h>
#include <unistd.h>

#include <string>
#include <vector>

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

int CreateDir(const char* path, long /*extra*/)
{
    // Up from `path` to the first name that exists or the top, then down
    // again making each: a loop, so that a deep path does not reach the
    // host's stack.
    std::vector<std::string> missing;
    std::string text = path != nullptr ? path : "";
    for (;;) {
        if (Sys().access(text.c_str(), F_OK) == 0) {
            break;
        }
        if (errno != ENOENT) {
            return 0;
        }
        missing.push_back(text);
        rvFilename name(text.c_str(), 0);
        const rvFilename parent(name.Directory(), 0);
        // The walk ends where the directory of a name is the name itself.
        if (parent == name) {
            break;
        }
        text = name.Directory();
    }
    for (auto name = missing.rbegin(); name != missing.rend(); ++name) {
        // A name with a trailing "/" is its own parent and exists by now.
        if (Sys().access(name->c_str(), F_OK) != 0 && Sys().mkdir(name->c_str(), kNewDirectoryMode) != 0) {
            return 0;
        }
    }
    return 1;
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
