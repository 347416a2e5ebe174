// The reporting idiom of the thread classes: a platform result becomes the
// object's m_lastError and, through CHECK_SYSERROR, the caller's status.
#ifndef TESSALINE_SRC_THREAD_REPORT_H
#define TESSALINE_SRC_THREAD_REPORT_H

#include "thread/relaxed.h"
#include "tessaline/thread/MThread.h"

namespace tessaline::thread {

// Stores `result` in m_lastError and hands it back. Callers decide on the
// value they stored, never on a re-read of the shared field, which a
// concurrent failure on another thread may already have overwritten.
// Inline, where StoreLastError, being exported, is a call through the PLT.
inline int Keep(MThreadError& object, int result)
{
    StoreRelaxed(object.m_lastError, result);
    return result;
}

// Keep, then the status: 0, or -1 with the CHECK_SYSERROR line. Success, by
// far the common case, makes no call into the exported (and so
// interposable) reporting function.
inline int Report(MThreadError& object, int result)
{
    return Keep(object, result) == 0 ? 0 : CHECK_SYSERROR(result);
}

}  // namespace tessaline::thread

#endif
