// The byte copy under rvCopyFile and the handle it owns.
#ifndef TESSALINE_SRC_FILES_COPY_BYTES_H
#define TESSALINE_SRC_FILES_COPY_BYTES_H

#include <stdint.h>

namespace tessaline::files {

// Owns a handle until Close; the destructor closes one still open.
class OwnedHandle {
public:
    explicit OwnedHandle(void* handle) : m_handle(handle) {}
    ~OwnedHandle() { Close(); }
    OwnedHandle(const OwnedHandle&) = delete;
    OwnedHandle& operator=(const OwnedHandle&) = delete;

    bool IsOpen() const;
    void* Get() const { return m_handle; }

    // 1 when the handle closed cleanly (or was not open).
    int Close();

private:
    void* m_handle;
};

// Copies the source's size in bytes, as it stood when the copy began: as far
// as the kernel copies between the files, then through a 16 KiB buffer. A read that finds the end early (the source shrank), a
// failed read or write, or a write that makes no progress fails; a source
// that grew is cut to its first size.
bool CopyBytes(void* from, void* to);

}  // namespace tessaline::files

#endif
