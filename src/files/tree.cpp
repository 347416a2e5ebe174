// Descriptor-relative pieces of the tree walks.
#include "files/tree.h"

#include <algorithm>
#include <cerrno>
#include <climits>
#include <cstring>
#include <memory>
#include <utility>

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

// Descriptors one walk keeps open on one side; deeper levels are reopened.
constexpr size_t kMaxOpenLevels = 32;

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
    // Both texts are translated already: a directory text short enough to
    // pass here holds no backslash.
    for (; *directory != '\0'; ++directory, ++member) {
        if (*member != *directory) {
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

WalkPlan PlanWalk(const Place& entry, const char* wildcardText)
{
    WalkPlan plan;
    // A directory below the host's path walked whole: its own text, which
    // the walk formed, needs no split (a split asks the file system).
    const size_t length = std::strlen(entry.text);
    if (!entry.IsHost() && std::strncmp(wildcardText, entry.text, length) == 0 &&
        std::strcmp(wildcardText + length, "/*") == 0) {
        plan.from = WalkFrom::kEntry;
        plan.directory = entry.text;
        plan.memberDirectory = entry.text;
        plan.pattern = "*";
        return plan;
    }
    rvFilename directory(nullptr, 0);
    rvFilename pattern(nullptr, 0);
    SplitWalk(wildcardText, &directory, &pattern);
    plan.pattern = static_cast<const char*>(pattern);
    plan.memberDirectory = rvFilename(wildcardText, 0).Directory();
    plan.directory = static_cast<const char*>(directory);
    // Members are placed by the text they are joined to; a walk that would
    // list one directory and act in another has no place.
    std::string name;
    if (!SameDirectoryText(plan.directory, plan.memberDirectory)) {
        plan.from = WalkFrom::kNothing;
    } else if (entry.IsHost()) {
        plan.from = WalkFrom::kHostPath;
    } else if (SameDirectoryText(plan.directory, entry.text)) {
        plan.from = WalkFrom::kEntry;
    } else if (NameInside(plan.directory.c_str(), entry.text, &name)) {
        plan.from = WalkFrom::kEntryDirectory;
    }
    return plan;
}

Listing::Listing(int directory, const char* pattern)
{
    const int fd = Sys().openat(directory, ".", O_RDONLY | O_DIRECTORY | O_CLOEXEC, 0);
    if (fd < 0) {
        return;
    }
    std::unique_ptr<DIR, DirCloser> dir(Sys().fdopendir(fd));
    if (!dir) {
        Sys().close(fd);
        return;
    }
    // A listing leaves errno as it was: an unreadable rest of a directory
    // lists nothing more, like an unreadable directory.
    const int callerError = errno;
    for (;;) {
        const dirent* entry = Sys().readdir(dir.get());
        if (entry == nullptr) {
            break;
        }
        const char* name = entry->d_name;
        if (!IsDotOrDotDot(name) && fnmatch(pattern, name, FNM_PATHNAME) == 0) {
            m_names += static_cast<char>(entry->d_type);
            m_names.append(name, std::strlen(name) + 1);
        }
    }
    errno = callerError;
}

const char* Listing::Next(unsigned char* type)
{
    if (m_next >= m_names.size()) {
        return nullptr;
    }
    *type = static_cast<unsigned char>(m_names[m_next]);
    const char* name = m_names.c_str() + m_next + 1;
    m_next += std::strlen(name) + 2;
    return name;
}

bool DirectoryStack::Push(const Place& place, Links links)
{
    MakeRoom(m_levels.size());
    const int flags = O_RDONLY | O_DIRECTORY | O_CLOEXEC | (links == Links::kRefuse ? O_NOFOLLOW : 0);
    DirectoryFd fd(Sys().openat(place.directory, place.name, flags, 0));
    struct stat info;
    if (!fd.IsOpen() || Sys().fstat(fd.Get(), &info) != 0) {
        return false;
    }
    if (Holds(info.st_dev, info.st_ino)) {
        errno = ELOOP;
        return false;
    }
    m_levels.push_back(Level{std::move(fd), place.name, flags, info.st_dev, info.st_ino});
    ++m_open;
    return true;
}

void DirectoryStack::Pop()
{
    const size_t depth = m_levels.size();
    Level& deepest = m_levels.back();
    if (depth >= 2 && deepest.fd.IsOpen() && !m_levels[depth - 2].fd.IsOpen()) {
        // Up by "..", where that is still the level above: one open on the
        // way back instead of a walk down from an open level.
        Level& above = m_levels[depth - 2];
        DirectoryFd parent(Sys().openat(deepest.fd.Get(), "..", O_RDONLY | O_DIRECTORY | O_CLOEXEC, 0));
        struct stat info;
        if (parent.IsOpen() && Sys().fstat(parent.Get(), &info) == 0 && info.st_dev == above.device &&
            info.st_ino == above.inode) {
            above.fd = std::move(parent);
            ++m_open;
            m_firstOpen = std::min(m_firstOpen, depth - 2);
        }
    }
    if (deepest.fd.IsOpen()) {
        --m_open;
    }
    m_levels.pop_back();
    m_firstOpen = std::max<size_t>(1, std::min(m_firstOpen, m_levels.size()));
}

int DirectoryStack::At(size_t level)
{
    if (m_levels[level].fd.IsOpen()) {
        return m_levels[level].fd.Get();
    }
    size_t open = level;
    while (!m_levels[open].fd.IsOpen()) {
        --open;
    }
    m_firstOpen = std::min(m_firstOpen, open + 1);
    for (size_t next = open + 1; next <= level; ++next) {
        MakeRoom(next);
        Level& reopened = m_levels[next];
        reopened.fd = DirectoryFd(Sys().openat(m_levels[next - 1].fd.Get(), reopened.name.c_str(), reopened.flags, 0));
        struct stat info;
        if (!reopened.fd.IsOpen()) {
            return -1;
        }
        ++m_open;
        if (Sys().fstat(reopened.fd.Get(), &info) != 0 || info.st_dev != reopened.device ||
            info.st_ino != reopened.inode) {
            reopened.fd = DirectoryFd();
            --m_open;
            return -1;
        }
    }
    return m_levels[level].fd.Get();
}

bool DirectoryStack::HoldsDeepestOf(const DirectoryStack& other) const
{
    return !other.m_levels.empty() && Holds(other.m_levels.back().device, other.m_levels.back().inode);
}

bool DirectoryStack::Holds(dev_t device, ino_t inode) const
{
    for (const Level& level : m_levels) {
        if (level.device == device && level.inode == inode) {
            return true;
        }
    }
    return false;
}

void DirectoryStack::MakeRoom(size_t limit)
{
    for (; m_open >= kMaxOpenLevels && m_firstOpen + 1 < limit; ++m_firstOpen) {
        if (m_levels[m_firstOpen].fd.IsOpen()) {
            m_levels[m_firstOpen].fd = DirectoryFd();
            --m_open;
        }
    }
}

}  // namespace tessaline::files
