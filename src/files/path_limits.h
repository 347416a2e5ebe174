// Working limits of path text: work areas of 4096 bytes, at most 4095
// characters translated or copied, at most 4094 taken apart.
#ifndef TESSALINE_SRC_FILES_PATH_LIMITS_H
#define TESSALINE_SRC_FILES_PATH_LIMITS_H

#include <stddef.h>

namespace tessaline::files {

constexpr size_t kPathWorkArea = 4096;
constexpr size_t kMaxTranslateLength = kPathWorkArea - 1;
constexpr size_t kMaxSplitLength = kPathWorkArea - 2;

}  // namespace tessaline::files

#endif
