// The one reporting rule of the thread classes.
#include <cerrno>
#include <cstdio>
#include <cstring>

#include "tessaline/thread/MThread.h"
#include "util/error_text.h"

int CHECK_SYSERROR(int err)
{
    if (err == 0) {
        return 0;
    }
    if (err == ENOENT || err == ESRCH || err == EAGAIN) {
        return -1;
    }
    // The line keeps its classic %d form; on LP64 that shows the low 32 bits
    // of the thread identifier.
    std::fprintf(stderr, "Thread #%d error: %s (%d)\n", static_cast<int>(pthread_self()),
                 tessaline::util::ErrorText(err), err);
    return -1;
}

MThreadError::MThreadError() : m_lastError(0) {}

int MThreadError::LastError()
{
    return __atomic_load_n(&m_lastError, __ATOMIC_RELAXED);
}

char* MThreadError::LastErrorText()
{
    return const_cast<char*>(tessaline::util::ErrorText(LastError()));
}

void MThreadError::StoreLastError(int code)
{
    __atomic_store_n(&m_lastError, code, __ATOMIC_RELAXED);
}
