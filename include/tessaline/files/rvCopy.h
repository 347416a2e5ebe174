/// @file
/// @brief Copying, linking, moving, removing and comparing files, wildcards
/// and directory trees, and the size of a file.
///
/// All functions return plain counts or flags and throw nothing of their own;
/// the cause of a failure, where there is one, is left in errno. They go on
/// past a failed member of a wildcard or tree and count what succeeded, so a
/// result of 0 may mean failure, nothing to do or nothing found: callers that
/// care compare the count with what they expect. Only rvUnlink prints, one
/// line for a file it cannot remove.
///
/// Names are taken apart by rvFilename: a directory text without "/" (a bare
/// "data") has no directory part and walks nothing; write "./data". Entries
/// whose names hold "*" or "?" are themselves taken as patterns when a tree is
/// copied or removed.
///
/// Bytes move by `copy_file_range` as far as the kernel copies between the
/// two files; wherever it stops (another file system, a device, a source
/// that ends early, a full disk) the 16 KiB read/write loop carries on from
/// the same offsets and decides the result, so counts, failures and errno
/// are those of the loop. On file systems that share extents the target may
/// share blocks with the source; its bytes are the same.
///
/// Thread safety: no locks and no shared state; calls on separate trees are
/// independent. Each directory is listed once, when the walk enters it: a
/// member added later is not seen, one removed meanwhile counts as missing.
///
/// Deep trees. The walks keep their place in a tree on the heap, not on the
/// stack: a call needs the same few KiB of the host thread's stack (a 16 KiB
/// copy buffer at most) however deep the tree, and holds at most 32 directory
/// descriptors for each tree it walks, closing and reopening the others by
/// name as it goes (only where they are still the same directory). A member
/// whose text would pass the platform's path limit (PATH_MAX, 4096 with its
/// NUL) is not reached: that branch ends there, as for any unreachable
/// member.
///
/// Cycles. A walk never enters a directory that is already on its path (the
/// same device and inode), whichever way it is reached: a symbolic link back
/// up the tree, a bind mount, or a member whose name holds "*" or "?" and so
/// reads as a pattern of its own directory. The copy also does not walk a
/// source directory that it is writing into (a tree copied into itself).
/// Such a member counts as one failure (0): the copy makes its target
/// directory and leaves it empty; the comparison answers 0; removal, which
/// follows no links, leaves a pattern-named member in place.
///
/// Hostile trees. The path the host names (for a wildcard, its directory) is
/// resolved as given. Everything below it is reached through the open
/// descriptor of the directory it was listed in, never by its path text
/// again, so renaming a directory or swapping it for a symbolic link while a
/// call works cannot lead the call anywhere else:
/// - rvUnlink enters directories only with O_NOFOLLOW. A link, planted or
///   swapped in, is removed as a link and what it leads to stays, even where
///   removing the link fails. A read-only file is made writable only when it
///   is no link (the mode of a link is its target's, elsewhere).
/// - The copy reads through the links it finds on the source side, as it
///   always did, but `move` removes only files that were not reached through
///   a link to a directory: those are copied, counted and left in place.
/// - Below the target the host names, the copy never writes through a link:
///   a link at a member's target name fails that member (0), and a link
///   where a target directory should be takes none of its members.
/// - Member names are formed as rvFilename forms them. A name whose text
///   form leads out of its directory is left alone and counts 0, silently:
///   "..." reads as ".." with an empty extension, a backslash as "/". A member
///   whose full text passes the platform's path limit is left alone too, as a
///   call by that text would fail.
#ifndef TESSALINE_FILES_RVCOPY_H
#define TESSALINE_FILES_RVCOPY_H

#include <stdint.h>

#include "tessaline/export.h"

/// Copies `source` to `target` and returns the number of files copied (a link
/// made counts as one).
///
/// `source` is a file, a directory, or a path whose last part holds "*" or
/// "?". For a file, `target` is the file to write, never the directory to put
/// it in: an existing directory as `target` fails. For a wildcard or a
/// directory, `target` is the directory to fill; it is created with its
/// parents, and every match is copied into it under its own name (or, when
/// `target` exists as a file, onto that one file in turn). A directory copies
/// its whole content as the pattern "dir/*".
///
/// `recurse` 0 skips directories among the matches, non-zero copies them as
/// trees. `overwrite` 1 replaces the target in any case and makes its missing
/// directories; 0 replaces it only if its modification time or size differs
/// from the source (equal ones count as up to date and return 0, whatever the
/// contents), creates a missing target exclusively, and makes no directories;
/// any other value makes no directories but truncates as 1 does. `link`
/// non-zero makes a symbolic link instead of a copy (for a wildcard, first a
/// link of the whole directory; if that fails, links member by member); an
/// existing target makes it fail. `move` non-zero removes each source file
/// after its copy; source directories stay. `aux1` and `aux2` are not read.
/// `mode` is the permission of a target the
/// call creates, under the umask; an existing target keeps its mode. Nothing
/// else (time, owner) travels.
///
/// Sources with the scheme "ftp" or "http" in any letter case are refused.
/// A null `source` or `target` copies nothing.
///
/// Choices where the classic behaviour was open, made so that no data is lost:
/// - A copy onto the source itself (the same device and inode, also through
///   another name, a hard link or a symbolic link) returns 0 and leaves the
///   file untouched.
/// - A source that ends before its size was copied (it shrank during the
///   copy), a short write that cannot be completed, or a target that fails to
///   close fails the copy.
/// A failed copy removes the target it opened, even an older one it
/// truncated, and never removes the source. So a copy that fails after the
/// target was opened (a full disk, a file size limit, a failing read, write or
/// close) loses the old content of a target it replaces: the target is
/// truncated in place when opened, which keeps its inode, owner, mode and hard
/// links, and then removed. Where that removal itself fails (a read-only
/// directory), the truncated, partly written target stays. Failures before
/// the target is opened (missing or unreadable source, refused scheme, an
/// up-to-date target, a directory that cannot be made, a target that cannot
/// be opened) leave the target byte for byte.
TESSALINE_API int rvCopyFile(const char* source, const char* target, unsigned int recurse, unsigned int overwrite,
                             unsigned int link, unsigned int move, const char* aux1, const char* aux2,
                             unsigned long mode);

/// Removes a file, the entries that match a wildcard, or, with `recurse`
/// exactly 1, a directory tree; returns the number of files removed
/// (directories are not counted). A wildcard with `recurse` 0 leaves
/// directories alone. A symbolic link to a directory is removed as a link. A
/// read-only file that is not removed at the first try is made writable
/// (members of a tree are tried first, so a file that goes keeps its mode
/// for any other hard link to it). A file that cannot be removed makes
/// one line on the standard error stream,
/// "rvUnlink: Could not remove <path>: <platform text> (<errno>).", and adds 0;
/// so does a directory given with `recurse` other than 1. Missing paths and
/// directories that stay (not empty) are silent. A dangling symbolic link
/// counts as missing and stays. A null `path` removes nothing. A directory
/// named by the host that turns out to be a link when it is opened is not
/// entered (see "Hostile trees").
TESSALINE_API int rvUnlink(const char* path, unsigned int recurse);

/// 1 when every entry under `first` has an entry of the same name, kind and
/// size under `second`, recursively; else 0. One-way: entries only `second`
/// has do not matter. Contents are never compared. A missing `first` walks
/// nothing and gives 1; a missing `second` gives 0. A `first` ending in a
/// pattern ("dir/*.log") compares only the matches. Links are followed on
/// both sides; an entry that cannot be reached (past the path limit, a name
/// whose text reads as another one, a directory already on its side's path)
/// gives 0.
TESSALINE_API int CompareDirectoriesByFileSize(const char* first, const char* second);

/// The size of the file `path` names (backslashes accepted, symbolic links
/// followed), or 0 when it cannot be examined.
TESSALINE_API int64_t rvGetFileSize(const char* path);

/// The size of an open file, or -1 when the handle cannot be examined.
TESSALINE_API int64_t rvGetFileSize64(void* handle);

#endif
