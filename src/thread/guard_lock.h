// Scoped helpers for the library's own short critical sections.
#ifndef TESSALINE_SRC_THREAD_GUARD_LOCK_H
#define TESSALINE_SRC_THREAD_GUARD_LOCK_H

#include <pthread.h>

#include "util/thread_annotations.h"

namespace tessaline::thread {

// A pthread mutex of the library's own, as a lock the analysis can follow.
// Locking one that is initialised and not held by the caller cannot fail,
// so no result is looked at, and the calls stay off the seam.
class TESSALINE_CAPABILITY("mutex") PlatformMutex {
public:
    explicit PlatformMutex(pthread_mutex_t& native) : m_native(native) {}
    void Lock() TESSALINE_ACQUIRE() { pthread_mutex_lock(&m_native); }
    void Unlock() TESSALINE_RELEASE() { pthread_mutex_unlock(&m_native); }
    pthread_mutex_t& Native() { return m_native; }

private:
    pthread_mutex_t& m_native;
};

// Holds a lock (anything with Lock and Unlock) for one scope.
template <typename Mutex>
class TESSALINE_SCOPED_CAPABILITY GuardLock {
public:
    explicit GuardLock(Mutex& mutex) TESSALINE_ACQUIRE(mutex) : m_mutex(mutex) { m_mutex.Lock(); }
    ~GuardLock() TESSALINE_RELEASE() { m_mutex.Unlock(); }
    GuardLock(const GuardLock&) = delete;
    GuardLock& operator=(const GuardLock&) = delete;

private:
    Mutex& m_mutex;
};

// Keeps the calling thread from being cancelled for one scope. A thread that
// a host has made asynchronously cancellable could otherwise die inside a
// GuardLock and leave the lock held; a pending request is acted on when the
// old state returns, after the lock is gone (declare this before the lock).
// It holds no lock, so the analysis has nothing to check here.
class NoCancelScope {
public:
    NoCancelScope() { pthread_setcancelstate(PTHREAD_CANCEL_DISABLE, &m_oldState); }
    ~NoCancelScope() { pthread_setcancelstate(m_oldState, &m_oldState); }
    NoCancelScope(const NoCancelScope&) = delete;
    NoCancelScope& operator=(const NoCancelScope&) = delete;

private:
    int m_oldState = PTHREAD_CANCEL_ENABLE;
};

}  // namespace tessaline::thread

#endif
