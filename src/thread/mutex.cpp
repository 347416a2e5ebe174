// MMutex: a platform mutex plus a holder record for the checked and
// recursive modes.
#include <cerrno>

#include "thread/guard_lock.h"
#include "tessaline/thread/MThread.h"

using tessaline::GuardLock;

namespace {

// The refusals (2, 3, -2) all leave this code in m_lastError.
constexpr int kRefused = -2;

void storeErrno(int* err)
{
    if (err != nullptr) {
        *err = errno;
    }
}

bool isTracked(const MMutex& mutex)
{
    return mutex.m_type == MMutex_::MutexChecked || mutex.m_type == MMutex_::MutexRecursive;
}

// Lock and Try of the checked and recursive types.
int lockTracked(MMutex& mutex, int* err, bool blocking)
{
    const unsigned long self = pthread_self();
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
    }
    // The only blocking step; m_guard is not held across it.
    mutex.StoreLastError(blocking ? pthread_mutex_lock(&mutex.m_mutex) : pthread_mutex_trylock(&mutex.m_mutex));
    if (mutex.LastError() == 0) {
        GuardLock guard(mutex.m_guard);
        mutex.m_owner = self;
        mutex.m_count = 1;
        mutex.m_held = 1;
        __atomic_store_n(&mutex.m_locked, 1, __ATOMIC_RELAXED);
    }
    storeErrno(err);
    return CHECK_SYSERROR(mutex.LastError());
}

}  // namespace

MMutex_::MMutex_() : m_type(MutexPlain), m_locked(0) {}

int MMutex_::Locked() const
{
    return __atomic_load_n(&m_locked, __ATOMIC_RELAXED);
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
    StoreLastError(pthread_mutexattr_init(&m_attr));
    CHECK_SYSERROR(m_lastError);
    StoreLastError(pthread_mutex_init(&m_mutex, &m_attr));
    CHECK_SYSERROR(m_lastError);
    StoreLastError(pthread_mutex_init(&m_guard, nullptr));
    CHECK_SYSERROR(m_lastError);
    m_count = 0;
    m_owner = 0;
    m_held = 0;
    return CHECK_SYSERROR(LastError());
}

MMutex::operator pthread_mutex_t() const
{
    return m_mutex;
}


int MMutex::Lock(int* err)
{
    if (m_type == MutexPlain) {
        StoreLastError(pthread_mutex_lock(&m_mutex));
    } else if (isTracked(*this)) {
        return lockTracked(*this, err, true);
    }
    storeErrno(err);
    return CHECK_SYSERROR(LastError());
}

int MMutex::Try(int* err)
{
    StoreLastError(0);
    if (m_type == MutexPlain) {
        StoreLastError(pthread_mutex_trylock(&m_mutex));
    } else if (isTracked(*this)) {
        return lockTracked(*this, err, false);
    }
    storeErrno(err);
    return CHECK_SYSERROR(LastError());
}

int MMutex::Unlock(int* err)
{
    if (m_type == MutexPlain) {
        StoreLastError(pthread_mutex_unlock(&m_mutex));
    } else if (isTracked(*this)) {
        StoreLastError(0);
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
            __atomic_store_n(&m_locked, 0, __ATOMIC_RELAXED);
            StoreLastError(pthread_mutex_unlock(&m_mutex));
        }
    }
    storeErrno(err);
    return CHECK_SYSERROR(LastError());
}
