// Descriptor-relative pieces of the tree walks.
#include "files/tree.h"

#include <cerrno>
#include <climits>
#include <cstring>
#include <memory>

#include <dirent.h>
#include <fnmatch.h>
#include <sys/stat.h>

#include "files/sys.h"
#include "tessaline/files/rvFilename.h"

namespace tessaline::files {
namespace {

struct DirCloser {
    void operator()(DIR* dir) const { Sys().closedir(dir); }
};

bool IsDotOrDotDot(const char* name)
{
    return std::strcmp(name, ".") == 0 || std::strcmp(name, "..") == 0;
}

bool IsSeparator(char c)
{
    return c == '/' || c == '\\';
}

}  // namespace

DirectoryFd::~DirectoryFd()
{
    if (m_fd >= 0) {
        Sys().close(m_fd);
    }
}

DirectoryFd& DirectoryFd::operator=(DirectoryFd&& other) noexcept
{
    if (this != &other) {
        if (m_fd >= 0) {
            Sys().close(m_fd);
        }
        m_fd = other.m_fd;
        other.m_fd = -1;
    }
    return *this;
}

DirectoryFd OpenDirectory(const Place& place, Links links)
{
    const int flags = O_RDONLY | O_DIRECTORY | O_CLOEXEC | (links == Links::kRefuse ? O_NOFOLLOW : 0);
    return DirectoryFd(Sys().openat(place.directory, place.name, flags, 0));
}

int IsDirectoryAt(const Place& place)
{
    if (place.IsHost()) {
        return rvFilename::IsDirectory(place.text);
    }
    struct stat info;
    return Sys().fstatat(place.directory, place.name, &info, 0) == 0 ? IsDirectoryAt(place, info) : 0;
}

int IsDirectoryAt(const Place& place, const struct stat& info)
{
    if (place.IsHost()) {
        return rvFilename::IsDirectory(place.text);
    }
    return (info.st_mode & S_IFDIR) != 0 ? 1 : 0;
}

bool IsLinkAt(const Place& place)
{
    struct stat info;
    return Sys().fstatat(place.directory, place.name, &info, AT_SYMLINK_NOFOLLOW) == 0 && S_ISLNK(info.st_mode);
}

bool NameInside(const char* directoryText, const char* memberText, std::string* name)
{
    if (*directoryText == '\0' || std::strlen(memberText) >= PATH_MAX) {
        return false;
    }
    const char* member = memberText;
    const char* directory = directoryText;
    for (; *directory != '\0'; ++directory, ++member) {
        const bool same = *member == *directory || (*directory == '\\' && *member == '/');
        if (!same) {
            return false;
        }
    }
    if (!IsSeparator(directory[-1])) {
        if (*member != '/') {
            return false;
        }
        ++member;
    }
    if (*member == '\0' || IsDotOrDotDot(member) || std::strchr(member, '/') != nullptr) {
        return false;
    }
    name->assign(member);
    return true;
}

void SplitWalk(const char* path, rvFilename* directory, rvFilename* pattern)
{
    *pattern = path;
    directory->Join(nullptr, pattern->Server(), pattern->Directory(), nullptr, nullptr);
    pattern->Join(nullptr, nullptr, nullptr, pattern->File(), pattern->Ext());
    if (*static_cast<const char*>(*pattern) == '\0') {
        *pattern = "*";
    }
}

namespace {

// Two texts of one directory, trailing slashes aside.
bool SameDirectoryText(const std::string& first, const std::string& second)
{
    auto trimmed = [](std::string text) {
        while (text.size() > 1 && text.back() == '/') {
            text.pop_back();
        }
        return text;
    };
    return trimmed(first) == trimmed(second);
}

}  // namespace

Walk OpenWalk(const Place& entry, const char* wildcardText, Links links, bool throughLink)
{
    Walk walk;
    walk.throughLink = throughLink;
    rvFilename directory(nullptr, 0);
    rvFilename pattern(nullptr, 0);
    SplitWalk(wildcardText, &directory, &pattern);
    walk.pattern = static_cast<const char*>(pattern);
    walk.memberDirectory = rvFilename(wildcardText, 0).Directory();
    const std::string directoryText = static_cast<const char*>(directory);
    // Members are placed by the text they are joined to; a walk that would
    // list one directory and act in another has no place.
    if (!SameDirectoryText(directoryText, walk.memberDirectory)) {
        return walk;
    }
    std::string name;
    if (entry.IsHost()) {
        walk.owned = OpenDirectory(Place::Host(directoryText.c_str()), Links::kFollow);
    } else if (SameDirectoryText(directoryText, entry.text)) {
        if (links == Links::kFollow && IsLinkAt(entry)) {
            walk.throughLink = true;
            walk.owned = OpenDirectory(entry, Links::kFollow);
        } else {
            walk.owned = OpenDirectory(entry, Links::kRefuse);
        }
    } else if (NameInside(directoryText.c_str(), entry.text, &name) && name == entry.name) {
        walk.directory = entry.directory;
        return walk;
    }
    walk.directory = walk.owned.Get();
    return walk;
}

void ForEachEntry(int directory, const char* pattern, const std::function<void(const char* name)>& visit)
{
    // A descriptor of its own, so the listing keeps its position while the
    // caller works in the same directory.
    const int fd = Sys().openat(directory, ".", O_RDONLY | O_DIRECTORY | O_CLOEXEC, 0);
    if (fd < 0) {
        return;
    }
    std::unique_ptr<DIR, DirCloser> dir(Sys().fdopendir(fd));
    if (!dir) {
        Sys().close(fd);
        return;
    }
    const int callerError = errno;
    for (;;) {
        errno = 0;
        const dirent* entry = Sys().readdir(dir.get());
        if (entry == nullptr) {
            if (errno == 0) {
                errno = callerError;
            }
            return;
        }
        // The name stays valid until the next readdir of this listing,
        // which no visit makes.
        const char* name = entry->d_name;
        if (!IsDotOrDotDot(name) && fnmatch(pattern, name, FNM_PATHNAME) == 0) {
            visit(name);
        }
    }
}

}  // namespace tessaline::files
