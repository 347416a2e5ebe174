/*
 * Time values: a microsecond counter for measuring intervals.
 *
 * Thread safety: _gettickcount may be called from any thread, the first
 * call included.
 */
#ifndef TESSALINE_UTIL_RVTIME_H
#define TESSALINE_UTIL_RVTIME_H

#include "tessaline/util/export.h"

// Microseconds since the first call in the process, which returns 0. The
// count follows the wall clock (gettimeofday), so setting the system time
// shows in it, and it is cut to 32 bits although unsigned long is 64 bits
// wide here: it wraps to 0 about every 71.6 minutes, and differences of two
// readings are meant to be taken modulo 2^32. Returns 0 if the clock cannot
// be read. One system call, no allocation.
TESSALINE_API unsigned long _gettickcount();

#endif
