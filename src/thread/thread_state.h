// The state an MThread shares with its thread, and the internal steps of
// MThread shared by its source files.
#ifndef TESSALINE_SRC_THREAD_THREAD_STATE_H
#define TESSALINE_SRC_THREAD_THREAD_STATE_H

#include <atomic>

#include "thread/guard_lock.h"
#include "util/thread_annotations.h"
#include "tessaline/thread/MThread.h"

namespace tessaline::thread {

// m_state values.
constexpr int kNoThreadCreated = 0;
constexpr int kJoinable = 1;
constexpr int kDetached = 3;

// What an MThread and its thread both use: the object's m_mutex and m_cond
// point here. Reference-counted, so that it outlives whichever of the two
// ends last: a host may delete the object while the routine runs, and the
// thread still takes the lock and signals when the routine ends. The thread
// writes the object's fields only while the object is there (Owner), and
// only under the lock.
class TESSALINE_CAPABILITY("mutex") ThreadControl {
public:
    // One reference, the owner's.
    explicit ThreadControl(MThread& owner) : m_owner(&owner) {}
    ThreadControl(const ThreadControl&) = delete;
    ThreadControl& operator=(const ThreadControl&) = delete;

    void Retain() { m_references.fetch_add(1, std::memory_order_relaxed); }
    // Deletes the block with its last reference.
    void Release()
    {
        if (m_references.fetch_sub(1, std::memory_order_acq_rel) == 1) {
            delete this;
        }
    }

    // The platform mutex of m_mutex, for the library's own short spans.
    void Lock() TESSALINE_ACQUIRE() { pthread_mutex_lock(&m_mutex.m_mutex); }
    void Unlock() TESSALINE_RELEASE() { pthread_mutex_unlock(&m_mutex.m_mutex); }
    // For a span that took m_mutex through MMutex::Lock.
    void AssertHeld() TESSALINE_ASSERT_CAPABILITY(this) {}

    // The object, or null once it has been destroyed.
    MThread* Owner() TESSALINE_REQUIRES(this) { return m_owner; }
    void Disown() TESSALINE_REQUIRES(this) { m_owner = nullptr; }

    // Whether a Wait is joining the thread: nothing may detach it meanwhile
    // (the joiner reaps it; detaching under a joiner is undefined).
    bool Joining() TESSALINE_REQUIRES(this) { return m_joining; }
    void SetJoining(bool joining) TESSALINE_REQUIRES(this) { m_joining = joining; }

    MMutex m_mutex{MMutex_::MutexPlain};
    MCondVar m_cond;
    // What the created thread runs; set before it starts, read only by it.
    void* (*m_routine)(void*) = nullptr;
    void* m_arg = nullptr;

private:
    ~ThreadControl() = default;

    std::atomic<int> m_references{1};
    MThread* m_owner TESSALINE_GUARDED_BY(this);
    bool m_joining TESSALINE_GUARDED_BY(this) = false;
};

// Holds a thread's lock for one scope, with cancellation of the caller held
// off, so that no cancellation leaves it locked.
class TESSALINE_SCOPED_CAPABILITY ThreadObjectLock {
public:
    explicit ThreadObjectLock(ThreadControl& control) TESSALINE_ACQUIRE(control) : m_lock(control) {}
    ~ThreadObjectLock() TESSALINE_RELEASE() {}
    ThreadObjectLock(const ThreadObjectLock&) = delete;
    ThreadObjectLock& operator=(const ThreadObjectLock&) = delete;

private:
    NoCancelScope m_noCancel;
    GuardLock<ThreadControl> m_lock;
};

// Asks the object's thread to stop: the platform result, or ESRCH when the
// object has no thread to act on.
int RequestCancel(ThreadControl& control, MThread& thread);

}  // namespace tessaline::thread

#endif
