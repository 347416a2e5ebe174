// Stand-ins for the platform calls behind the file services' seam.
#ifndef TESSALINE_TESTS_FILES_SYS_FAKES_H
#define TESSALINE_TESTS_FILES_SYS_FAKES_H

#include <cerrno>

#include "files/sys.h"

namespace tessaline::test {

// What a failed platform call returns, with `error` in errno.
inline int Fail(int error)
{
    errno = error;
    return -1;
}

// A file system without a kernel-side copy: rvCopyFile copies through its
// buffer, where the read and write seams see every byte.
inline void NoKernelCopy()
{
    files::Sys().copy_file_range = [](int, loff_t*, int, loff_t*, size_t, unsigned int) -> ssize_t {
        return Fail(EXDEV);
    };
}

}  // namespace tessaline::test

#endif
