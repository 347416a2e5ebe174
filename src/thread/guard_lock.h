// Scoped helpers for the library's own short critical sections.
#ifndef TESSALINE_SRC_THREAD_GUARD_LOCK_H
#define TESSALINE_SRC_THREAD_GUARD_LOCK_H

#include <pthread.h>

namespace tessaline {

// Holds a raw pthread mutex for one scope.
class GuardLock {
public:
    explicit GuardLock(pthread_mutex_t& mutex) : m_mutex(mutex) { pthread_mutex_lock(&m_mutex); }
    ~GuardLock() { pthread_mutex_unlock(&m_mutex); }
    GuardLock(const GuardLock&) = delete;
    GuardLock& operator=(const GuardLock&) = delete;

private:
    pthread_mutex_t& m_mutex;
};

// Keeps the calling thread from being cancelled for one scope. A thread that
// a host has made asynchronously cancellable could otherwise die inside a
// GuardLock and leave the lock held; a pending request is acted on when the
// old state returns, after the lock is gone (declare this before the lock).
class NoCancelScope {
public:
    NoCancelScope() { pthread_setcancelstate(PTHREAD_CANCEL_DISABLE, &m_oldState); }
    ~NoCancelScope() { pthread_setcancelstate(m_oldState, &m_oldState); }
    NoCancelScope(const NoCancelScope&) = delete;
    NoCancelScope& operator=(const NoCancelScope&) = delete;

private:
    int m_oldState = PTHREAD_CANCEL_ENABLE;
};

}  // namespace tessaline

#endif
