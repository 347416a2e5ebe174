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

void setRecord(MMutex& mutex, unsigned long owner, int count, int held)
{
    mutex.m_owner = owner;
    mutex.m_count = count;
    mutex.m_held = held;
    tessaline::storeRelaxed(mutex.m_locked, held);
}

// Lock and Try of the checked and recursive types. A free mutex is taken
// with trylock inside the same guard section that reads the record, so the
// uncontended case costs one guard round instead of two; trylock never
// blocks, so holding m_guard across it keeps the lock order. Only when the
// platform mutex is taken does the caller leave the guard and block on it.
// The record still changes only after the platform mutex is held.
int lockTracked(MMutex& mutex, int* err, bool blocking)
{
    const unsigned long self = pthread_self();
    int result;
    {
        GuardLock guard(mutex.m_guard);
        if (mutex.m_held == 1) {
            if (mutex.m_type == MMutex_::MutexChecked) {
                mutex.StoreLastError(kRefused);
                storeErrno(err);
                return 2;
            }
            if (mutex.m_owner == self) {
                ++mutex.m_count;
                return 0;
            }
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

}  // namespace

namespace tessaline {

MutexRecord readRecord(MMutex& mutex)
{
    GuardLock guard(mutex.m_guard);
    return MutexRecord{mutex.m_owner, mutex.m_count, mutex.m_held};
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
    int result = record(*this, 0);
    {
        GuardLock guard(m_guard);
        if (m_held == 0) {
            StoreLastError(kRefused);
            storeErrno(err);
            return 3;
        }
        if (m_owner != static_cast<unsigned long>(pthread_self())) {
            StoreLastError(kRefused);
            return -2;
        }
        if (--m_count == 0) {
            m_owner = 0;
            m_held = 0;
            tessaline::storeRelaxed(m_locked, 0);
            result = record(*this, pthread_mutex_unlock(&m_mutex));
        }
    }
    return finish(result, err);
}
