// MMutex: a platform mutex plus a holder record for the checked and
// recursive modes.
#include <cerrno>

#include "thread/guard_lock.h"
#include "thread/mutex_record.h"
#include "thread/relaxed.h"
#include "tessaline/thread/MThread.h"

using tessaline::GuardLock;
using tessaline::isTracked;
using tessaline::loadRelaxed;
using tessaline::MutexRecord;

namespace {

// The refusals (2, 3, -2) all leave this code in m_lastError.
constexpr int kRefused = -2;

void storeErrno(int* err)
{
    if (err != nullptr) {
        *err = errno;
    }
}

// Stores a platform result in m_lastError and hands it back. Callers decide
// on the value they stored, never on a re-read of the shared field, which a
// concurrent failure on another thread may already have overwritten.
int record(MThreadError& object, int result)
{
    tessaline::storeRelaxed(object.m_lastError, result);
    return result;
}

// The tail of Lock, Try and Unlock. Success, by far the common case, needs no
// call into the exported (and so interposable) reporting function.
int finish(int result, int* err)
{
    storeErrno(err);
    return result == 0 ? 0 : CHECK_SYSERROR(result);
}

// The record's fields are read and written atomically: the holder changes
// them without m_guard (below), while other threads look at them under it.
void setRecord(MMutex& mutex, unsigned long owner, int count, int held)
{
    tessaline::storeRelaxed(mutex.m_owner, owner);
    tessaline::storeRelaxed(mutex.m_count, count);
    tessaline::storeRelaxed(mutex.m_held, held);
    tessaline::storeRelaxed(mutex.m_locked, held);
}

// Only the holder ever finds its own identifier in m_owner: it writes it
// after taking m_mutex and clears it before letting go. So the holder's own
// steps (re-entry, release) are decided without m_guard, and no other thread
// can see a record that the guard would have shown it differently.
bool isHolder(const MMutex& mutex, unsigned long self)
{
    return loadRelaxed(mutex.m_owner) == self;
}

// Lock and Try of the recursive type: the holder re-enters and counts;
// anyone else goes to m_mutex, where the record is free by the time it
// succeeds.
int lockRecursive(MMutex& mutex, int* err, bool blocking)
{
    const unsigned long self = pthread_self();
    if (isHolder(mutex, self)) {
        tessaline::storeRelaxed(mutex.m_count, loadRelaxed(mutex.m_count) + 1);
        return 0;
    }
    const int result = blocking ? pthread_mutex_lock(&mutex.m_mutex) : pthread_mutex_trylock(&mutex.m_mutex);
    if (result == 0) {
        setRecord(mutex, self, 1, 1);
    }
    record(mutex, result);
    return finish(result, err);
}

// Lock and Try of the checked type. A free mutex is taken with trylock
// inside the same guard section that reads the record, so the uncontended
// case costs one guard round instead of two; trylock never blocks, so
// holding m_guard across it keeps the lock order. Only when the platform
// mutex is taken does the caller leave the guard and block on it. The record
// still changes only after the platform mutex is held.
int lockChecked(MMutex& mutex, int* err, bool blocking)
{
    const unsigned long self = pthread_self();
    int result;
    {
        GuardLock guard(mutex.m_guard);
        if (loadRelaxed(mutex.m_held) == 1) {
            mutex.StoreLastError(kRefused);
            storeErrno(err);
            return 2;
        }
        result = pthread_mutex_trylock(&mutex.m_mutex);
        if (result == 0)
            setRecord(mutex, self, 1, 1);
    }
    if (result != 0 && blocking) {
        // The only blocking step; m_guard is not held across it.
        result = pthread_mutex_lock(&mutex.m_mutex);
        if (result == 0)
            tessaline::writeRecord(mutex, MutexRecord{self, 1, 1});
    }
    record(mutex, result);
    return finish(result, err);
}

int lockTracked(MMutex& mutex, int* err, bool blocking)
{
    return mutex.m_type == MMutex_::MutexRecursive ? lockRecursive(mutex, err, blocking)
                                                   : lockChecked(mutex, err, blocking);
}

}  // namespace

namespace tessaline {

MutexRecord readRecord(MMutex& mutex)
{
    GuardLock guard(mutex.m_guard);
    return MutexRecord{loadRelaxed(mutex.m_owner), loadRelaxed(mutex.m_count), loadRelaxed(mutex.m_held)};
}

void writeRecord(MMutex& mutex, const MutexRecord& record)
{
    GuardLock guard(mutex.m_guard);
    setRecord(mutex, record.owner, record.count, record.held);
}

}  // namespace tessaline

MMutex_::MMutex_() : m_type(MutexPlain), m_locked(0) {}

int MMutex_::Locked() const
{
    return loadRelaxed(m_locked);
}

MMutex::MMutex(MMutex_::MutexType type) : m_attr(), m_mutex(), m_guard(), m_count(0), m_owner(0), m_held(0)
{
    Create(type, nullptr);
}

MMutex::~MMutex()
{
    pthread_mutexattr_destroy(&m_attr);
    pthread_mutex_destroy(&m_mutex);
    pthread_mutex_destroy(&m_guard);
}

int MMutex::Create(MMutex_::MutexType type, int* /*err*/)
{
    StoreLastError(0);
    m_type = type;
    CHECK_SYSERROR(record(*this, pthread_mutexattr_init(&m_attr)));
    CHECK_SYSERROR(record(*this, pthread_mutex_init(&m_mutex, &m_attr)));
    const int result = record(*this, pthread_mutex_init(&m_guard, nullptr));
    CHECK_SYSERROR(result);
    m_count = 0;
    m_owner = 0;
    m_held = 0;
    return CHECK_SYSERROR(result);
}

MMutex::operator pthread_mutex_t() const
{
    return m_mutex;
}

int MMutex::Lock(int* err)
{
    if (m_type == MutexPlain) {
        return finish(record(*this, pthread_mutex_lock(&m_mutex)), err);
    }
    if (isTracked(*this)) {
        return lockTracked(*this, err, true);
    }
    return finish(loadRelaxed(m_lastError), err);
}

int MMutex::Try(int* err)
{
    StoreLastError(0);
    if (m_type == MutexPlain) {
        return finish(record(*this, pthread_mutex_trylock(&m_mutex)), err);
    }
    if (isTracked(*this)) {
        return lockTracked(*this, err, false);
    }
    return finish(0, err);
}

int MMutex::Unlock(int* err)
{
    if (m_type == MutexPlain) {
        return finish(record(*this, pthread_mutex_unlock(&m_mutex)), err);
    }
    if (!isTracked(*this)) {
        return finish(loadRelaxed(m_lastError), err);
    }
    const unsigned long self = pthread_self();
    if (isHolder(*this, self)) {
        int result = 0;
        const int count = loadRelaxed(m_count) - 1;
        if (count > 0) {
            tessaline::storeRelaxed(m_count, count);
        } else {
            setRecord(*this, 0, 0, 0);
            result = pthread_mutex_unlock(&m_mutex);
        }
        return finish(record(*this, result), err);
    }
    // The refusals. m_owner cannot turn into the caller meanwhile.
    GuardLock guard(m_guard);
    StoreLastError(kRefused);
    if (loadRelaxed(m_held) == 0) {
        storeErrno(err);
        return 3;
    }
    return -2;
}
