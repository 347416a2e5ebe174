// The platform calls of the text, number and time helpers that tests need
// to replace, and the pause that the file openers of other subsystems share.
// The library reads the table on every call; a test swaps entries under a
// testing::ScopedSysCalls (tests/support/scoped_sys_calls.h). Not part of the
// installed interface.
#ifndef TESSALINE_SRC_UTIL_SYS_H
#define TESSALINE_SRC_UTIL_SYS_H

#include <time.h>

namespace tessaline::util {

struct SysCalls {
    int (*nanosleep)(const struct timespec* pause, struct timespec* left);
};

// The live table.
SysCalls& Sys();

// The pause between two tries to open a file: one second, resumed after a
// signal. Configuration files and CreateFile both try three times.
void PauseOneSecond();

}  // namespace tessaline::util

#endif
