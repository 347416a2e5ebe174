// rvCopyFile: files, wildcards and trees, copied, linked or moved.
//
// Below the paths the host names, both sides of a tree copy are reached
// through the open descriptors of their directories, never by their texts
// again. The source side reads through symbolic links as it finds them; the
// target side never writes through one, and `move` removes only files that
// were not reached through a link to a directory.
#include "tessaline/files/rvCopy.h"

#include <cerrno>
#include <cstring>
#include <string>

#include <fcntl.h>
#include <sys/stat.h>

#include "files/copy_bytes.h"
#include "files/handle.h"
#include "files/open_at.h"
#include "files/sys.h"
#include "files/tree.h"
#include "tessaline/files/rvFilename.h"
#include "tessaline/files/rvPath.h"
#include "tessaline/util/HashToken.h"
#include "files/scheme_tokens.h"

using tessaline::files::DirectoryFd;
using tessaline::files::Links;
using tessaline::files::OwnedHandle;
using tessaline::files::Place;
using tessaline::files::Sys;
using tessaline::files::Walk;

namespace {

constexpr int kReadWriteCreate = O_RDWR | O_CREAT;
constexpr int kSourceOpenMode = 0664;
constexpr mode_t kNewDirectoryMode = 06775;

struct CopyOptions {
    unsigned int recurse;
    unsigned int overwrite;
    unsigned int link;
    unsigned int move;
    unsigned long mode;
};

// One side of a copy. `below` marks a place under the path the host named;
// `throughLink` a source reached through a symbolic link to a directory.
struct End {
    Place place;
    bool below;
    bool throughLink;
};

bool IsWildcard(const char* path)
{
    return std::strpbrk(path, "*?") != nullptr;
}

int StatAt(const Place& place, struct stat* info)
{
    return Sys().fstatat(place.directory, place.name, info, 0);
}

int ExistsAt(const Place& place)
{
    return Sys().faccessat(place.directory, place.name, F_OK, 0) == 0;
}

bool IsSameFile(const struct stat& first, const struct stat& second)
{
    return first.st_dev == second.st_dev && first.st_ino == second.st_ino;
}

// Only a text with "://" has a scheme; the split is skipped for the others,
// as it asks the file system about the text.
bool IsRefusedScheme(const char* text)
{
    if (std::strstr(text, "://") == nullptr) {
        return false;
    }
    rvFilename name(text, 0);
    const int scheme =
        HashToken(name.Scheme(), tessaline::files::g_schemeTokens, tessaline::files::kSchemeTokenLast, 0, 1);
    return scheme == tessaline::files::kSchemeFtp || scheme == tessaline::files::kSchemeHttp;
}

// CreateDir for a target; below the host's path the parent is already open.
int MakeDirectory(const End& target)
{
    if (!target.below) {
        return CreateDir(target.place.text, 0);
    }
    if (ExistsAt(target.place)) {
        return 1;
    }
    if (errno != ENOENT) {
        return 0;
    }
    return Sys().mkdirat(target.place.directory, target.place.name, kNewDirectoryMode) == 0;
}

// The link of a wildcard's whole directory. Below the host's path the new
// name can only be the target itself; its directory exists, so a link there
// would fail anyway.
bool LinkDirectory(const char* existing, const End& target)
{
    rvFilename to(target.place.text, 0);
    if (!target.below) {
        return Sys().symlinkat(existing, AT_FDCWD, to.Directory()) == 0;
    }
    return std::strcmp(to.Directory(), target.place.text) == 0 &&
           Sys().symlinkat(existing, target.place.directory, target.place.name) == 0;
}

int CopyAt(const End& source, const End& target, const CopyOptions& options);

// The wildcard way: every match of `wildcardText` into the directory `target`.
int CopyMatches(const End& source, const char* wildcardText, const End& target, const CopyOptions& options)
{
    if (options.link != 0 && LinkDirectory(rvFilename(wildcardText, 0).Directory(), target)) {
        return 1;
    }
    if (MakeDirectory(target) == 0) {
        return 0;
    }
    // The target is judged once: a directory takes the members under their
    // own names; anything else takes every member in turn, unless it is a
    // link to a directory below the host's path, which is never written into.
    const DirectoryFd into =
        tessaline::files::OpenDirectory(target.place, target.below ? Links::kRefuse : Links::kFollow);
    if (!into.IsOpen() && target.below && tessaline::files::IsDirectoryAt(target.place) == 1) {
        return 0;
    }
    const std::string intoText = rvFilename(target.place.text, 0).Directory();

    const Walk walk = tessaline::files::OpenWalk(source.place, wildcardText, Links::kFollow, source.throughLink);
    if (walk.directory < 0) {
        return 0;
    }
    int total = 0;
    tessaline::files::ForEachEntry(walk.directory, walk.pattern.c_str(), [&](const char* entry) {
        rvFilename item(entry, 0);
        item.Directory(walk.memberDirectory.c_str());
        std::string fromName;
        if (!tessaline::files::NameInside(walk.memberDirectory.c_str(), item, &fromName)) {
            return;
        }
        const End from{{walk.directory, fromName.c_str(), item}, true, walk.throughLink};
        if (options.recurse == 0 && tessaline::files::IsDirectoryAt(from.place) == 1) {
            return;
        }
        if (!into.IsOpen()) {
            total += CopyAt(from, target, options);
            return;
        }
        rvFilename to(nullptr, 0);
        to.Join(nullptr, nullptr, intoText.c_str(), item.File(), item.Ext());
        std::string toName;
        if (tessaline::files::NameInside(intoText.c_str(), to, &toName)) {
            total += CopyAt(from, End{{into.Get(), toName.c_str(), to}, true, false}, options);
        }
    });
    return total;
}

// The single way: one file onto the file `target`.
int CopyOne(const End& source, const End& target, const CopyOptions& options)
{
    // One stat of the source serves every question asked of it below. It
    // stands for `access` as well: for mere existence both fail alike.
    struct stat sourceInfo;
    if (StatAt(source.place, &sourceInfo) != 0) {
        return 0;
    }
    if (tessaline::files::IsDirectoryAt(source.place, sourceInfo) == 1) {
        // Below the host's path the text is not split again: the split asks
        // the file system, which may answer differently by now.
        const std::string wildcard =
            source.below ? std::string(source.place.text) + "/*" : rvFilename(source.place.text, 0).File("*");
        return CopyMatches(source, wildcard.c_str(), target, options);
    }
    unsigned int overwrite = options.overwrite;
    if (overwrite == 1 && !target.below && CreateDir(rvFilename(target.place.text, 0).Directory(), 0) == 0) {
        return 0;
    }
    struct stat targetInfo;
    const bool targetExists = StatAt(target.place, &targetInfo) == 0;
    if (overwrite != 1 && targetExists) {
        if (sourceInfo.st_mtime == targetInfo.st_mtime && sourceInfo.st_size == targetInfo.st_size) {
            return 0;
        }
        overwrite = 1;
    }
    if (IsRefusedScheme(source.place.text)) {
        return 0;
    }
    if (options.link != 0) {
        return Sys().symlinkat(source.place.text, target.place.directory, target.place.name) == 0 ? 1 : 0;
    }
    if (targetExists && IsSameFile(sourceInfo, targetInfo)) {
        return 0;
    }

    OwnedHandle from(tessaline::files::CreateFileAt(source.place.directory, source.place.name, O_RDONLY | O_CLOEXEC, 0,
                                                    kSourceOpenMode));
    if (!from.IsOpen()) {
        return 0;
    }
    // Below the host's path a link at the target's name is not written
    // through: it may lead anywhere.
    const int targetAccess = kReadWriteCreate | O_CLOEXEC | (target.below ? O_NOFOLLOW : 0);
    OwnedHandle to(tessaline::files::CreateFileAt(target.place.directory, target.place.name, targetAccess,
                                                  overwrite != 0 ? O_TRUNC : O_EXCL, static_cast<int>(options.mode)));
    if (!to.IsOpen()) {
        return 0;
    }
    bool copied = tessaline::files::CopyBytes(from.Get(), to.Get());
    from.Close();
    copied = to.Close() == 1 && copied;

    if (!copied) {
        Sys().unlinkat(target.place.directory, target.place.name, 0);
        return 0;
    }
    if (options.move != 0 && !source.throughLink) {
        Sys().unlinkat(source.place.directory, source.place.name, 0);
    }
    return 1;
}

int CopyAt(const End& source, const End& target, const CopyOptions& options)
{
    return IsWildcard(source.place.text) ? CopyMatches(source, source.place.text, target, options)
                                         : CopyOne(source, target, options);
}

}  // namespace

int rvCopyFile(const char* source, const char* target, unsigned int recurse, unsigned int overwrite, unsigned int link,
               unsigned int move, const char* /*aux1*/, const char* /*aux2*/, unsigned long mode)
{
    if (source == nullptr || target == nullptr) {
        return 0;
    }
    const CopyOptions options = {recurse, overwrite, link, move, mode};
    const rvFilename src(source, 0);
    const rvFilename dst(target, 0);
    return CopyAt(End{Place::Host(src), false, false}, End{Place::Host(dst), false, false}, options);
}
