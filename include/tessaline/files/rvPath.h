/**
 * @file
 * @brief File-system queries and directory creation under plain names.
 *
 * The functions keep plain (unmangled) names and are callable from C; this
 * header also compiles as C.
 *
 * Results are plain return values; nothing is printed. After a failure the
 * cause stays in errno. A null path is treated as the empty name, which
 * names nothing (ENOENT). No state is shared: every function may run on any
 * thread.
 */
#ifndef TESSALINE_FILES_RVPATH_H
#define TESSALINE_FILES_RVPATH_H

#include "tessaline/export.h"

TESSALINE_EXTERN_C_BEGIN

/**
 * Creates the directory `path` and any missing parents, the top one first,
 * with mode 06775 under the umask (Linux ignores the set-user-ID bit on
 * directories; set-group-ID follows the parent). Returns 1 when `path` exists
 * on return, whatever its type, else 0. Parents are found by the directory
 * component of rvFilename, so a bare relative name ("newdir") has the empty
 * name as parent and fails, while "old/new" works when "old" exists. An
 * existing name that cannot be examined (EACCES, ENOTDIR, ENAMETOOLONG)
 * gives 0 at once. Parents made before a deeper failure stay. The parents
 * are found in a loop, not by recursion, so the depth of `path` is limited
 * only by the path limit. `extra` is not read; give 0.
 */
TESSALINE_API int CreateDir(const char* path, long extra);

/**
 * Writes into `out` the absolute name of `path` with links resolved
 * (realpath), cut to `length` - 1 characters, zero-filled to `length` bytes,
 * and returns `out`. A path that cannot be resolved is copied unchanged, cut
 * the same way; there is no error indication but errno. A `length` of 0 or a
 * null `out` writes nothing.
 */
TESSALINE_API char* GetFullDirectoryName(const char* path, char* out, unsigned int length);

/** 1 when stat(path) succeeds: a directory exists, a dangling link does not. */
TESSALINE_API int FileExists(const char* path);

/**
 * Bytes an unprivileged process may still write on the file system holding
 * `path` (statfs: f_bavail * f_bsize), or 0 when statfs fails, which cannot
 * be told from a full disk. A product beyond the 64-bit range saturates.
 */
TESSALINE_API long long DiskFreeSpace(const char* path);

TESSALINE_EXTERN_C_END

#endif
