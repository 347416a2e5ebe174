// Internal steps of MThread shared by its source files.
#ifndef TESSALINE_SRC_THREAD_THREAD_STATE_H
#define TESSALINE_SRC_THREAD_THREAD_STATE_H

#include "tessaline/thread/MThread.h"

namespace tessaline {

// m_state values.
constexpr int kNoThreadCreated = 0;
constexpr int kJoinable = 1;
constexpr int kDetached = 3;

// Holds a thread object's m_mutex for one scope, with cancellation of the
// caller held off, so that no cancellation leaves it locked.
class ThreadObjectLock {
public:
    explicit ThreadObjectLock(MThread& thread);
    ~ThreadObjectLock();
    ThreadObjectLock(const ThreadObjectLock&) = delete;
    ThreadObjectLock& operator=(const ThreadObjectLock&) = delete;

private:
    pthread_mutex_t& m_mutex;
    int m_oldCancelState;
};

// Asks the object's thread to stop: the platform result, or ESRCH when the
// object has no thread to act on.
int requestCancel(MThread& thread);

}  // namespace tessaline

#endif
