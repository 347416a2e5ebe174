// CreateFile relative to an open directory, for the tree walks.
#ifndef TESSALINE_SRC_FILES_OPEN_AT_H
#define TESSALINE_SRC_FILES_OPEN_AT_H

namespace tessaline::files {

// CreateFile with `name` taken relative to the directory descriptor
// `directory` (AT_FDCWD for the current directory): the same flags, attempts,
// pauses and result.
void* CreateFileAt(int directory, const char* name, int access, int disposition, int mode);

}  // namespace tessaline::files

#endif
