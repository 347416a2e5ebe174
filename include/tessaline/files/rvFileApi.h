/**
 * @file
 * @brief Handle-based file calls in the classic style, over the platform's
 * file descriptors.
 *
 * A handle is a file descriptor carried in a pointer-sized value; (void*)-1
 * is the invalid handle. There is no table of open files: a handle has no
 * state beyond its descriptor, and the caller owns it until CloseHandle.
 * The cause of a failure is left in errno, so it is per thread and the next
 * call may overwrite it; GetLastError and GetLastErrorText read it. All calls
 * may run on any thread; calls on one handle share its file position as the
 * platform defines it.
 *
 * The `share`, `security`, `templateFile` and `overlapped` arguments are
 * accepted for the shape of the interface and never read.
 *
 * Typical use:
 * @code
 *   void* h = CreateFile("/tmp/log", O_RDWR | O_CREAT, 0, 0, O_TRUNC, 0644, 0);
 *   if (h == (void*)-1) { GetLastErrorText(buf, sizeof buf, -1); ... }
 *   WriteFile(h, "x", 1, &done, 0);
 *   CloseHandle(h);
 * @endcode
 *
 * Port note: the file offset is 64 bits wide, so SetFilePointer64 hands the
 * whole offset to lseek, and sizes are not limited to 32 bits. This holds on
 * 32-bit x86 too, where the library is built with 64-bit file offsets: the
 * classic 32-bit calls passed only the lower half of the offset and failed
 * (EOVERFLOW, size -1) on files of 2 GiB and more.
 */
#ifndef TESSALINE_FILES_RVFILEAPI_H
#define TESSALINE_FILES_RVFILEAPI_H

#include <stdint.h>

#include "tessaline/export.h"

TESSALINE_EXTERN_C_BEGIN

/**
 * Opens `path` with the open flags `access | disposition | 0x8000` (0x8000 is
 * O_LARGEFILE, harmless on x86-64); both arguments are the platform's own
 * open flags and pass straight through, O_CLOEXEC included. `mode` is the
 * permission of a file that gets created.
 *
 * Makes up to three attempts; an open interrupted by a signal is repeated at
 * once within the same attempt. EEXIST fails at once. ENOENT (and a failure
 * that leaves errno 0) sleeps one second after the attempt, the last one
 * included, so a missing file without O_CREAT takes three seconds to fail.
 * Any other error tries again without a pause. Returns the handle, or
 * (void*)-1 with errno from the last attempt.
 */
TESSALINE_API void* CreateFile(const char* path, int access, int share, void* security, int disposition, int mode,
                               void* templateFile);

/** 1 when close succeeded, else 0 with errno set. */
TESSALINE_API int CloseHandle(void* handle);

/**
 * Reads up to `count` bytes, repeating a read interrupted by a signal. A short
 * count is success, and at the end of the file the call returns 1 with
 * `*done` 0. On failure returns 0, stores (unsigned long)-1 in `*done` and
 * leaves the cause in errno. `done` may be null.
 */
TESSALINE_API int ReadFile(void* handle, void* buffer, unsigned long count, unsigned long* done, void* overlapped);

/** As ReadFile, for writing: one write call, a short count is success. */
TESSALINE_API int WriteFile(void* handle, const void* buffer, unsigned long count, unsigned long* done,
                            void* overlapped);

/** The size of the open file, or -1 when fstat fails. */
TESSALINE_API int64_t GetFileSize64(void* handle);

/**
 * The lower 32 bits of GetFileSize64; the upper 32 bits go to `*high` when
 * `high` is not null. After a failure both halves are 0xFFFFFFFF.
 */
TESSALINE_API unsigned long GetFileSize(void* handle, unsigned long* high);

/**
 * Moves the file position by lseek with the platform's SEEK_SET, SEEK_CUR or
 * SEEK_END in `whence`, and returns the new position, or -1 with errno set.
 * The whole 64-bit offset is used (port change, see above).
 */
TESSALINE_API int64_t SetFilePointer64(void* handle, int64_t offset, int whence);

/**
 * With `wait` non-zero, blocks until this process holds a lockf lock from the
 * current position to the end of the file and beyond. With `wait` 0 it takes
 * no lock: it only tests whether another process holds one there (F_TEST).
 * Returns 1 on success, 0 when the section is locked by another process or
 * lockf fails (cause in errno). The locks belong to the process and do not
 * exclude its own threads.
 */
TESSALINE_API int Lock(void* handle, int wait);

/** Releases the lock on the same section as Lock; 1 on success, else 0. */
TESSALINE_API int Unlock(void* handle);

TESSALINE_EXTERN_C_END

#ifdef __cplusplus

/** errno of the calling thread. */
TESSALINE_API int GetLastError();

/**
 * The platform's text for `error`, or for GetLastError() when `error` is
 * 0xFFFFFFFF (only the lower 32 bits count, so (unsigned long)-1 works too).
 * With a `buffer` the text is copied into it, cut to `size` - 1 characters as
 * rv_safe_strcpy cuts (a `size` of 0 still writes a NUL into buffer[0]),
 * and `buffer` is returned. Without one the text itself
 * is returned; it is the platform's and stays valid until the next strerror
 * call on this thread.
 */
TESSALINE_API char* GetLastErrorText(char* buffer, unsigned long size, unsigned long error);

#endif

#endif
