// rvUnlink: files, wildcards and trees removed.
//
// Below the path the host names, every member is reached through the open
// descriptor of the directory it was listed in, and a directory is entered
// only with O_NOFOLLOW: a directory swapped for a symbolic link while the
// walk works is removed as the link it has become, and what it leads to stays.
#include "tessaline/files/rvCopy.h"

#include <cerrno>
#include <cstddef>
#include <cstdio>
#include <cstring>
#include <deque>
#include <string>

#include <dirent.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include "files/member_text.h"
#include "files/sys.h"
#include "files/tree.h"
#include "tessaline/files/rvFilename.h"
#include "util/error_text.h"

namespace tessaline::files {
namespace {

constexpr mode_t kWritableByAll = 0222;

bool IsWildcard(const char* path)
{
    return std::strpbrk(path, "*?") != nullptr;
}

// rmdir, or unlink where the name turned out to be no directory. A
// directory that stays (not empty) stays in silence.
void RemoveDirectory(int directory, const char* name)
{
    if (Sys().unlinkat(directory, name, AT_REMOVEDIR) != 0 && errno == ENOTDIR) {
        Sys().unlinkat(directory, name, 0);
    }
}

// The whole removal of one call: the directories it is in, and one level
// per directory being walked.
class TreeRemoval {
public:
    int Run(const char* path, unsigned int recurse)
    {
        Visit(Place::Host(path), recurse, DT_UNKNOWN);
        while (!m_levels.empty()) {
            Step();
        }
        return m_total;
    }

private:
    // A directory being walked: the matches of a wildcard, or all of a tree,
    // which goes itself once it is empty.
    struct Level {
        Listing listing;
        std::string memberDirectory;
        unsigned int recurse;
        // A tree's own name, in the directory of the level above or, at -1,
        // at the host's path; empty for the matches of a wildcard.
        std::string treeName;
        ptrdiff_t parentLevel;
    };

    // `type` is the entry's dirent type where the listing told it.
    void Visit(const Place& place, unsigned int recurse, unsigned char type)
    {
        if (IsWildcard(place.text)) {
            EnterMatches(place, recurse);
            return;
        }
        // A listed directory is no link: it is walked without asking again.
        if (type == DT_DIR && recurse == 1) {
            EnterTree(place);
            return;
        }
        // A listed file is unlinked at once: the read-only rule only matters
        // for a file that does not go, and a file that goes keeps its mode for
        // any other hard link to it, which may stand outside the tree.
        if (type == DT_REG && Sys().unlinkat(place.directory, place.name, 0) == 0) {
            ++m_total;
            return;
        }
        // One stat stands for `access` and the directory test (for mere
        // existence both fail alike) and tells whether the file is writable.
        struct stat info;
        if (Sys().fstatat(place.directory, place.name, &info, 0) != 0) {
            return;
        }
        if (IsDirectoryAt(place, info) == 1 && recurse == 1) {
            // A link to a directory goes as a link.
            if (Sys().unlinkat(place.directory, place.name, 0) != 0) {
                EnterTree(place);
            }
            return;
        }
        m_total += RemoveFile(place, info);
    }

    void EnterMatches(const Place& place, unsigned int recurse)
    {
        const WalkPlan plan = PlanWalk(place, place.text);
        bool entered = false;
        switch (plan.from) {
        case WalkFrom::kHostPath:
            entered = m_directories.Push(Place::Host(plan.directory.c_str()), Links::kFollow);
            break;
        case WalkFrom::kEntry:
            entered = m_directories.Push(place, Links::kRefuse);
            break;
        case WalkFrom::kEntryDirectory:
            errno = ELOOP;
            break;
        case WalkFrom::kNothing:
            break;
        }
        if (entered) {
            m_levels.push_back(
                Level{Listing(Deepest(), plan.pattern.c_str()), plan.memberDirectory, recurse, std::string(), -1});
        }
    }

    // A directory is emptied first and removed when its level ends.
    void EnterTree(const Place& place)
    {
        const ptrdiff_t parentLevel = place.IsHost() ? -1 : static_cast<ptrdiff_t>(m_directories.Depth()) - 1;
        if (!m_directories.Push(place, Links::kRefuse)) {
            RemoveDirectory(place.directory, place.name);
            return;
        }
        m_levels.push_back(Level{Listing(Deepest(), "*"), place.text, 1, place.name, parentLevel});
    }

    // The next member of the deepest level, or the end of that level.
    void Step()
    {
        Level& level = m_levels.back();
        unsigned char type = DT_UNKNOWN;
        const char* entry = level.listing.Next(&type);
        const int directory = entry != nullptr ? Deepest() : -1;
        if (directory < 0) {
            Leave();
            return;
        }
        const std::string text = MemberText(level.memberDirectory.c_str(), entry);
        std::string name;
        if (!NameInside(level.memberDirectory.c_str(), text.c_str(), &name)) {
            return;
        }
        const Place member{directory, name.c_str(), text.c_str()};
        if (level.recurse == 0 && type != DT_REG && IsDirectoryAt(member) == 1) {
            return;
        }
        Visit(member, level.recurse, type);
    }

    void Leave()
    {
        m_directories.Pop();
        const Level& level = m_levels.back();
        if (!level.treeName.empty()) {
            const int parent = level.parentLevel < 0 ? AT_FDCWD : m_directories.At(level.parentLevel);
            if (parent != -1) {
                RemoveDirectory(parent, level.treeName.c_str());
            }
        }
        m_levels.pop_back();
    }

    int Deepest() { return m_directories.At(m_directories.Depth() - 1); }

    // What access(W_OK) answers, from the stat where the mode bits decide
    // it (root, or the file's owner), by asking otherwise.
    bool Writable(const Place& place, const struct stat& info)
    {
        if (m_user == 0) {
            return true;
        }
        if (info.st_uid == m_user) {
            return (info.st_mode & S_IWUSR) != 0;
        }
        return Sys().faccessat(place.directory, place.name, W_OK, 0) == 0;
    }

    int RemoveFile(const Place& place, const struct stat& info)
    {
        // The mode of a link is its target's: a link is never made writable.
        if (!Writable(place, info)) {
            Sys().fchmodat(place.directory, place.name, kWritableByAll, AT_SYMLINK_NOFOLLOW);
        }
        if (Sys().unlinkat(place.directory, place.name, 0) != 0) {
            const int error = errno;
            std::fprintf(stderr, "rvUnlink: Could not remove %s: %s (%d).\n", place.text,
                         tessaline::util::ErrorText(error), error);
            return 0;
        }
        return 1;
    }

    const uid_t m_user = getuid();
    DirectoryStack m_directories;
    // A deque, so that a level stays in place while deeper ones are added.
    std::deque<Level> m_levels;
    int m_total = 0;
};

}  // namespace
}  // namespace tessaline::files

int rvUnlink(const char* path, unsigned int recurse)
{
    if (path == nullptr) {
        return 0;
    }
    // The text as rvFilename normalizes it: backslashes turned to "/".
    const rvFilename name(path, 0);
    return tessaline::files::TreeRemoval().Run(name, recurse);
}
