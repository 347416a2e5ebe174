// The byte copy under rvCopyFile.
#ifndef TESSALINE_SRC_FILES_COPY_BYTES_H
#define TESSALINE_SRC_FILES_COPY_BYTES_H

#include <cstdint>

namespace tessaline::files {

// Copies `size` bytes, the source's size as it stood when the copy began:
// as far as the kernel copies between the files, then through a 16 KiB
// buffer. A read that finds the end early (the source shrank), a failed
// read or write, or a write that makes no progress fails; a source that
// grew is cut to its first size.
bool CopyBytes(void* from, void* to, int64_t size);

}  // namespace tessaline::files

#endif
