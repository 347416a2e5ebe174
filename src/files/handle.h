// The handles of the file calls: a descriptor carried in a pointer.
#ifndef TESSALINE_SRC_FILES_HANDLE_H
#define TESSALINE_SRC_FILES_HANDLE_H

#include <stdint.h>

#include "tessaline/files/rvFileApi.h"

namespace tessaline::files {

inline int Descriptor(void* handle)
{
    return static_cast<int>(reinterpret_cast<intptr_t>(handle));
}

inline void* Handle(int fd)
{
    return reinterpret_cast<void*>(static_cast<intptr_t>(fd));
}

// What a failed open returns.
inline void* InvalidHandle()
{
    return Handle(-1);
}

// Owns a handle until Close; the destructor closes one still open.
class OwnedHandle {
public:
    explicit OwnedHandle(void* handle) : m_handle(handle) {}
    ~OwnedHandle() { Close(); }
    OwnedHandle(const OwnedHandle&) = delete;
    OwnedHandle& operator=(const OwnedHandle&) = delete;

    bool IsOpen() const { return m_handle != InvalidHandle(); }
    void* Get() const { return m_handle; }

    // Closes the handle held and takes `handle`.
    void Reset(void* handle)
    {
        Close();
        m_handle = handle;
    }

    // 1 when the handle closed cleanly (or was not open).
    int Close()
    {
        if (!IsOpen()) {
            return 1;
        }
        void* handle = m_handle;
        m_handle = InvalidHandle();
        return CloseHandle(handle);
    }

private:
    void* m_handle;
};

}  // namespace tessaline::files

#endif
