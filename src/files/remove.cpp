// rvUnlink: files, wildcards and trees removed.
#include "tessaline/files/rvCopy.h"

#include <cerrno>
#include <cstdio>
#include <cstring>

#include <unistd.h>

#include "files/sys.h"
#include "tessaline/files/rvDirIterator.h"
#include "tessaline/files/rvFilename.h"

using tessaline::files::Sys;

namespace {

constexpr mode_t kWritableByAll = 0222;

bool IsDotOrDotDot(const char* name)
{
    return std::strcmp(name, ".") == 0 || std::strcmp(name, "..") == 0;
}

int RemoveMatches(rvFilename& name, unsigned int recurse)
{
    int total = 0;
    for (rvDirIterator entry(name); entry != rvDirIterator(); ++entry) {
        if (IsDotOrDotDot(*entry)) {
            continue;
        }
        rvFilename item(*entry, 0);
        item.Directory(name.Directory());
        if (recurse == 0 && rvFilename::IsDirectory(item) == 1) {
            continue;
        }
        total += rvUnlink(item, recurse);
    }
    return total;
}

// A link to a directory goes as a link; a real directory is emptied first.
// A directory that stays non-empty is left in silence.
int RemoveTree(const char* path)
{
    int total = 0;
    if (Sys().unlink(path) != 0) {
        for (rvDirIterator entry(path); entry != rvDirIterator(); ++entry) {
            if (IsDotOrDotDot(*entry)) {
                continue;
            }
            rvFilename item(*entry, 0);
            item.Directory(path);
            total += rvUnlink(item, 1);
        }
    }
    if (Sys().rmdir(path) != 0 && errno == ENOTDIR) {
        Sys().unlink(path);
    }
    return total;
}

int RemoveFile(const char* path)
{
    if (Sys().access(path, W_OK) != 0) {
        Sys().chmod(path, kWritableByAll);
    }
    if (Sys().unlink(path) != 0) {
        const int error = errno;
        std::fprintf(stderr, "rvUnlink: Could not remove %s: %s (%d).\n", path,
                     std::strerror(error), error);
        return 0;
    }
    return 1;
}

}  // namespace

int rvUnlink(const char* path, unsigned int recurse)
{
    if (path == nullptr) {
        return 0;
    }
    rvFilename name(path, 0);
    if (std::strpbrk(path, "*?") != nullptr) {
        return RemoveMatches(name, recurse);
    }
    if (Sys().access(name, F_OK) != 0) {
        return 0;
    }
    if (rvFilename::IsDirectory(name) == 1 && recurse == 1) {
        return RemoveTree(name);
    }
    return RemoveFile(name);
}
