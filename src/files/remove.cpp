// rvUnlink: files, wildcards and trees removed.
//
// Below the path the host names, every member is reached through the open
// descriptor of the directory it was listed in, and a directory is entered
// only with O_NOFOLLOW: a directory swapped for a symbolic link while the
// walk works is removed as the link it has become, and what it leads to stays.
#include "tessaline/files/rvCopy.h"

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <string>

#include <sys/stat.h>
#include <unistd.h>

#include "files/member_text.h"
#include "files/sys.h"
#include "files/tree.h"
#include "tessaline/files/rvFilename.h"
#include "util/error_text.h"

using tessaline::files::DirectoryFd;
using tessaline::files::Links;
using tessaline::files::Place;
using tessaline::files::Sys;
using tessaline::files::Walk;

namespace {

constexpr mode_t kWritableByAll = 0222;

bool IsWildcard(const char* path)
{
    return std::strpbrk(path, "*?") != nullptr;
}

int RemoveAt(const Place& place, unsigned int recurse);

// Calls `remove` with the place of every member of `directory` that `walk`
// lists, named as rvFilename joins it to `directoryText`. A member whose
// joined text leads out of the directory is left alone.
template <typename Remove>
void ForEachMember(int directory, const std::string& directoryText, const char* pattern, Remove remove)
{
    tessaline::files::ForEachEntry(directory, pattern, [&](const char* entry) {
        const std::string text = tessaline::files::MemberText(directoryText.c_str(), entry);
        std::string name;
        if (tessaline::files::NameInside(directoryText.c_str(), text.c_str(), &name)) {
            remove(Place{directory, name.c_str(), text.c_str()});
        }
    });
}

int RemoveMatches(const Place& entry, unsigned int recurse)
{
    const Walk walk = tessaline::files::OpenWalk(entry, entry.text, Links::kRefuse, false);
    int total = 0;
    if (walk.directory >= 0) {
        ForEachMember(walk.directory, walk.memberDirectory, walk.pattern.c_str(), [&](const Place& member) {
            if (recurse == 0 && tessaline::files::IsDirectoryAt(member) == 1) {
                return;
            }
            total += RemoveAt(member, recurse);
        });
    }
    return total;
}

// A link to a directory goes as a link; a real directory is emptied first.
// A directory that stays non-empty is left in silence.
int RemoveTree(const Place& place)
{
    int total = 0;
    if (Sys().unlinkat(place.directory, place.name, 0) != 0) {
        const DirectoryFd directory = tessaline::files::OpenDirectory(place, Links::kRefuse);
        if (directory.IsOpen()) {
            ForEachMember(directory.Get(), place.text, "*", [&](const Place& member) { total += RemoveAt(member, 1); });
        }
    }
    if (Sys().unlinkat(place.directory, place.name, AT_REMOVEDIR) != 0 && errno == ENOTDIR) {
        Sys().unlinkat(place.directory, place.name, 0);
    }
    return total;
}

int RemoveFile(const Place& place)
{
    // The mode of a link is its target's: a link is never made writable.
    if (Sys().faccessat(place.directory, place.name, W_OK, 0) != 0) {
        Sys().fchmodat(place.directory, place.name, kWritableByAll, AT_SYMLINK_NOFOLLOW);
    }
    if (Sys().unlinkat(place.directory, place.name, 0) != 0) {
        const int error = errno;
        std::fprintf(stderr, "rvUnlink: Could not remove %s: %s (%d).\n", place.text, tessaline::util::ErrorText(error),
                     error);
        return 0;
    }
    return 1;
}

int RemoveAt(const Place& place, unsigned int recurse)
{
    if (IsWildcard(place.text)) {
        return RemoveMatches(place, recurse);
    }
    // One stat stands for `access` and the directory test: for mere
    // existence both fail alike.
    struct stat info;
    if (Sys().fstatat(place.directory, place.name, &info, 0) != 0) {
        return 0;
    }
    if (tessaline::files::IsDirectoryAt(place, info) == 1 && recurse == 1) {
        return RemoveTree(place);
    }
    return RemoveFile(place);
}

}  // namespace

int rvUnlink(const char* path, unsigned int recurse)
{
    if (path == nullptr) {
        return 0;
    }
    const rvFilename name(path, 0);
    return RemoveAt(Place::Host(name), recurse);
}
