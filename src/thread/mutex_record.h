// The holder record of the checked and recursive ("tracked") mutex types,
// shared by MMutex and by MCondVar, which puts it back after a wait.
//
// Whoever holds m_mutex is the holder, and only the holder writes the
// record: it changes hands with m_mutex. So the holder reads and changes it
// without m_guard, and the fields are accessed atomically for the threads
// that look at it meanwhile. Those threads take m_guard for their look, so
// that the look and the step taken on it (a refusal, the checked type's
// trylock) are one step among them.
#ifndef TESSALINE_SRC_THREAD_MUTEX_RECORD_H
#define TESSALINE_SRC_THREAD_MUTEX_RECORD_H

#include "thread/relaxed.h"
#include "thread/sys.h"
#include "util/thread_annotations.h"
#include "tessaline/thread/MThread.h"

namespace tessaline::thread {

struct MutexRecord {
    unsigned long owner;
    int count;
    int held;
};

// Checked and recursive mutexes keep the record; plain ones don't.
inline bool IsTracked(const MMutex& mutex)
{
    return mutex.m_type == MMutex_::MutexChecked || mutex.m_type == MMutex_::MutexRecursive;
}

// Whether `self` holds the mutex; no lock needed: only the holder ever finds
// its own identifier in m_owner, since it writes it after taking m_mutex and
// clears it before letting go.
inline bool IsHeldBy(const MMutex& mutex, unsigned long self)
{
    return LoadRelaxed(mutex.m_owner) == self;
}

// m_mutex of a tracked mutex, as the lock that owns the record.
class TESSALINE_CAPABILITY("mutex") HolderLock {
public:
    explicit HolderLock(MMutex& mutex) : m_mutex(mutex) {}

    // Takes m_mutex, waiting for it or not; true once held. `result` gets
    // the platform result either way.
    bool Acquire(bool blocking, int& result) TESSALINE_TRY_ACQUIRE(true)
    {
        result = blocking ? Sys().pthread_mutex_lock(&m_mutex.m_mutex) : Sys().pthread_mutex_trylock(&m_mutex.m_mutex);
        return result == 0;
    }

    // The platform result of letting m_mutex go.
    int Release() TESSALINE_RELEASE() { return Sys().pthread_mutex_unlock(&m_mutex.m_mutex); }

    // For a caller that holds m_mutex by its own contract.
    void AssertHeld() TESSALINE_ASSERT_CAPABILITY(this) {}

    MutexRecord Record() const TESSALINE_REQUIRES(this)
    {
        return MutexRecord{LoadRelaxed(m_mutex.m_owner), LoadRelaxed(m_mutex.m_count), LoadRelaxed(m_mutex.m_held)};
    }

    void SetRecord(const MutexRecord& record) TESSALINE_REQUIRES(this)
    {
        StoreRelaxed(m_mutex.m_owner, record.owner);
        StoreRelaxed(m_mutex.m_count, record.count);
        StoreRelaxed(m_mutex.m_held, record.held);
        StoreRelaxed(m_mutex.m_locked, record.held);
    }

    void SetCount(int count) TESSALINE_REQUIRES(this) { StoreRelaxed(m_mutex.m_count, count); }

private:
    MMutex& m_mutex;
};

// m_guard, taken by threads that are not the holder to look at the record.
// Held for short spans only, never while blocking on m_mutex.
class TESSALINE_CAPABILITY("mutex") RecordGuard {
public:
    explicit RecordGuard(MMutex& mutex) : m_mutex(mutex) {}
    void Lock() TESSALINE_ACQUIRE() { pthread_mutex_lock(&m_mutex.m_guard); }
    void Unlock() TESSALINE_RELEASE() { pthread_mutex_unlock(&m_mutex.m_guard); }

    // Whether the record names a holder.
    bool Held() const TESSALINE_REQUIRES(this) { return LoadRelaxed(m_mutex.m_held) == 1; }

private:
    MMutex& m_mutex;
};

}  // namespace tessaline::thread

#endif
