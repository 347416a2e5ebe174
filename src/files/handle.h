// The handles of the file calls: a descriptor carried in a pointer.
#ifndef TESSALINE_SRC_FILES_HANDLE_H
#define TESSALINE_SRC_FILES_HANDLE_H

#include <stdint.h>

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

}  // namespace tessaline::files

#endif
