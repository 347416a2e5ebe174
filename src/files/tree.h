// The pieces the tree copy and removal walk with: open directory descriptors,
// places named relative to them, and directory listings by pattern.
//
// A walk resolves the path the host named once. Below it, every member is
// reached through the descriptor of the directory it was listed in, so a
// directory that is renamed or swapped for a symbolic link while the walk
// works cannot redirect it. Member texts are still formed as rvFilename forms
// them (messages and recursion read them); a text that no longer names a
// single entry of its directory is not acted on.
#ifndef TESSALINE_SRC_FILES_TREE_H
#define TESSALINE_SRC_FILES_TREE_H

#include <fcntl.h>
#include <sys/stat.h>

#include <functional>
#include <string>

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

// The walk of a wildcard text: the open directory its members live in, the
// text they are joined to, and the pattern they must match.
struct Walk {
    DirectoryFd owned;            // the directory, when the walk opened one
    int directory = -1;           // -1: nothing to walk
    std::string memberDirectory;  // what rvFilename joins member names to
    std::string pattern;
    bool throughLink = false;  // the directory was reached through a link
};

// Opens the walk of `wildcardText` at `entry`: for the host's own text the
// directory is opened by its path; below it, the wildcard's directory must be
// the directory `entry` is in, or `entry` itself, which is opened relative to
// its directory. A link there is refused (`links` kRefuse) or followed and
// marked in `throughLink` (kFollow). `throughLink` carries over from the
// level above.
Walk OpenWalk(const Place& entry, const char* wildcardText, Links links, bool throughLink);

// Calls `visit` with every entry of the open `directory` whose name matches
// `pattern` (fnmatch with FNM_PATHNAME), in the order the platform lists
// them; "." and ".." are left out. Entries removed or added meanwhile give
// what the platform delivers.
void ForEachEntry(int directory, const char* pattern, const std::function<void(const char* name)>& visit);

}  // namespace tessaline::files

#endif
