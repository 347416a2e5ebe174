// The real platform calls behind the helpers' seam.
#include "util/sys.h"

#include <cerrno>

namespace tessaline::util {

namespace {

SysCalls g_sys = {::nanosleep};

}  // namespace

SysCalls& Sys()
{
    return g_sys;
}

void PauseOneSecond()
{
    timespec remaining = {1, 0};
    while (Sys().nanosleep(&remaining, &remaining) != 0 && errno == EINTR) {
    }
}

}  // namespace tessaline::util
