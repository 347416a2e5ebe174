// The pieces the tree copy and removal walk with: open directory descriptors,
// places named relative to them, directory listings by pattern, and the
// stack of directories a walk is in.
//
// A walk resolves the path the host named once. Below it, every member is
// reached through the descriptor of the directory it was listed in, so a
// directory that is renamed or swapped for a symbolic link while the walk
// works cannot redirect it. Member texts are still formed as rvFilename forms
// them (messages and recursion read them); a text that no longer names a
// single entry of its directory is not acted on.
//
// The walks keep their place in the tree on the heap, never in recursion,
// so the depth of a tree does not reach the host thread's stack.
#ifndef TESSALINE_SRC_FILES_TREE_H
#define TESSALINE_SRC_FILES_TREE_H

#include <fcntl.h>
#include <sys/stat.h>

#include <string>
#include <vector>

class rvFilename;

namespace tessaline::files {

// An open directory descriptor, close-on-exec, closed with the object.
class DirectoryFd {
public:
    DirectoryFd() = default;
    explicit DirectoryFd(int fd) : m_fd(fd) {}
    ~DirectoryFd();
    DirectoryFd(DirectoryFd&& other) noexcept : m_fd(other.m_fd) { other.m_fd = -1; }
    DirectoryFd& operator=(DirectoryFd&& other) noexcept;
    DirectoryFd(const DirectoryFd&) = delete;
    DirectoryFd& operator=(const DirectoryFd&) = delete;

    bool IsOpen() const { return m_fd >= 0; }
    int Get() const { return m_fd; }

private:
    int m_fd = -1;
};

// Where an operation acts: `name` inside the open directory `directory`, or
// the host's own path with AT_FDCWD. `text` is the name as the host would
// write it, for messages and member texts.
struct Place {
    int directory;
    const char* name;
    const char* text;

    static Place Host(const char* path) { return {AT_FDCWD, path, path}; }
    bool IsHost() const { return directory == AT_FDCWD; }
};

// Whether a symbolic link as the last component of a place is followed.
enum class Links { kFollow, kRefuse };

// Opens `place` as a directory, close-on-exec; not open on failure (errno).
DirectoryFd OpenDirectory(const Place& place, Links links);

// 1 when the place is a directory (links followed, the single-bit test of
// rvFilename::IsDirectory), else 0.
int IsDirectoryAt(const Place& place);

// The same answer from a stat of the place (links followed) that the caller
// already holds; only a host's text, with its forgiven trailing
// separators, is asked again.
int IsDirectoryAt(const Place& place, const struct stat& info);

// 1 when the place is a symbolic link.
bool IsLinkAt(const Place& place);

// The one entry name that `memberText` stands for inside the directory
// `directoryText`, as rvFilename joins the two. False when the text leads
// elsewhere: out of the directory ("..", as an entry named "..." reads),
// back to it, through further directories (a name holding a backslash), or
// past the platform's path limit, where a call by the text would fail.
bool NameInside(const char* directoryText, const char* memberText, std::string* name);

// The directory text and the pattern that a walk of `path` uses: the
// directory with its server, and the file name with extension, "*" when
// there is none.
void SplitWalk(const char* path, rvFilename* directory, rvFilename* pattern);

// Where the walk of a wildcard text lists its members.
enum class WalkFrom {
    kNothing,         // the text names no place to list
    kHostPath,        // the directory text, opened as the host wrote it
    kEntry,           // the entry itself, opened relative to its directory
    kEntryDirectory,  // the directory the entry is in: the walk's own
};

struct WalkPlan {
    WalkFrom from = WalkFrom::kNothing;
    std::string directory;        // the text to open, for kHostPath
    std::string memberDirectory;  // what rvFilename joins member names to
    std::string pattern;
};

// The walk of `wildcardText` at `entry`: for the host's own text the
// directory is opened by its path; below it, the wildcard's directory must be
// the directory `entry` is in, or `entry` itself.
WalkPlan PlanWalk(const Place& entry, const char* wildcardText);

// The names in one directory that match a pattern (fnmatch with
// FNM_PATHNAME), "." and ".." left out, read at once in the order the
// platform lists them: the listing holds no descriptor, and what the walk
// changes in the directory meanwhile does not change the listing. An
// unreadable directory lists nothing.
class Listing {
public:
    Listing(int directory, const char* pattern);

    // The next name and, in `type`, its dirent type (DT_UNKNOWN where the
    // file system does not tell); null after the last one.
    const char* Next(unsigned char* type);

private:
    std::string m_names;  // type byte, name, NUL; one after the other
    size_t m_next = 0;
};

// The directories from the top of a walk down to where it works. Each was
// opened relative to the one above it (the first as the host named it), and
// is held open while few enough are; the others are closed on the way down
// and reopened by name on the way back, from the nearest open one above, and
// only if the names still lead to the same directory (device and inode). So
// a walk holds a bounded number of descriptors however deep the tree.
class DirectoryStack {
public:
    DirectoryStack() = default;
    DirectoryStack(const DirectoryStack&) = delete;
    DirectoryStack& operator=(const DirectoryStack&) = delete;

    // Opens `place` as a directory and pushes it. `place.directory` is the
    // descriptor of the deepest level (At(Depth() - 1)), or AT_FDCWD for the
    // host's path on an empty stack. False, pushing nothing, when it cannot
    // be opened, or when it is already on the stack (errno ELOOP).
    bool Push(const Place& place, Links links);
    void Pop();
    size_t Depth() const { return m_levels.size(); }

    // The descriptor of the directory at `level`, valid until the next Push
    // or At; -1 when it had to be reopened and the names led elsewhere.
    int At(size_t level);

    // Whether the deepest directory of `other` is one of this stack's.
    bool HoldsDeepestOf(const DirectoryStack& other) const;

private:
    struct Level {
        DirectoryFd fd;
        std::string name;
        int flags;
        dev_t device;
        ino_t inode;
    };

    bool Holds(dev_t device, ino_t inode) const;
    // Closes the shallowest open levels, never the first nor those from
    // `limit` - 1 on, while `m_open` is at its bound.
    void MakeRoom(size_t limit);

    std::vector<Level> m_levels;
    size_t m_open = 0;
    // Levels from 1 up to here are closed.
    size_t m_firstOpen = 1;
};

}  // namespace tessaline::files

#endif
