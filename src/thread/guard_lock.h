// Scoped ownership of a raw pthread mutex for the library's own short
// critical sections.
#ifndef TESSALINE_SRC_THREAD_GUARD_LOCK_H
#define TESSALINE_SRC_THREAD_GUARD_LOCK_H

#include <pthread.h>

namespace tessaline {

class GuardLock {
public:
    explicit GuardLock(pthread_mutex_t& mutex) : m_mutex(mutex) { pthread_mutex_lock(&m_mutex); }
    ~GuardLock() { pthread_mutex_unlock(&m_mutex); }
    GuardLock(const GuardLock&) = delete;
    GuardLock& operator=(const GuardLock&) = delete;

private:
    pthread_mutex_t& m_mutex;
};

}  // namespace tessaline

#endif
