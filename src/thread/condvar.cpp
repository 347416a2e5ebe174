// MCondVar: a platform condition that waits on an MMutex and keeps a tracked
// mutex's holder record intact across the wait.
#include <cerrno>
#include <ctime>

#include "thread/guard_lock.h"
#include "thread/mutex_record.h"
#include "thread/relaxed.h"
#include "tessaline/thread/MThread.h"

using tessaline::isTracked;
using tessaline::MutexRecord;

namespace {

constexpr int kTimedOut = -5;
constexpr long kMillisecondsPerSecond = 1000;

// Clean-up of a waiter cancelled inside the platform wait, which has given
// it the mutex back: the record must not go on naming a dead thread (a
// checked mutex would refuse everyone for good), then the lock goes.
void releaseCancelledWaiter(void* arg)
{
    MMutex& mutex = *static_cast<MMutex*>(arg);
    if (isTracked(mutex)) {
        const MutexRecord record = tessaline::readRecord(mutex);
        if (record.held == 1 && record.owner == static_cast<unsigned long>(pthread_self())) {
            tessaline::writeRecord(mutex, MutexRecord{0, 0, 0});
        }
    }
    MCondVar::Cleanup(&mutex.m_mutex);
}

// The deadline starts from the current whole second, so the wait may end up
// to a second early; at least one second is added.
timespec deadlineAfter(long timeout)
{
    const long seconds = timeout / kMillisecondsPerSecond;
    timespec deadline{};
    deadline.tv_sec = std::time(nullptr) + (seconds < 1 ? 1 : seconds);
    return deadline;
}

}  // namespace

MCondVar_::MCondVar_() = default;

MCondVar::MCondVar() : m_cond(), m_attr()
{
    Create(nullptr);
}

MCondVar::~MCondVar()
{
    pthread_condattr_destroy(&m_attr);
    pthread_cond_destroy(&m_cond);
}

int MCondVar::Create(int* err)
{
    int result = pthread_condattr_init(&m_attr);
    StoreLastError(result);
    CHECK_SYSERROR(result);
    result = pthread_cond_init(&m_cond, &m_attr);
    StoreLastError(result);
    CHECK_SYSERROR(result);
    if (err != nullptr) {
        *err = errno;
    }
    return CHECK_SYSERROR(result);
}

int MCondVar::Wait(MMutex_& mutex, int* /*err*/, long timeout)
{
    auto* target = dynamic_cast<MMutex*>(&mutex);
    if (target == nullptr) {
        StoreLastError(EINVAL);
        return CHECK_SYSERROR(EINVAL);
    }
    if (timeout < 0) {
        StoreLastError(ETIMEDOUT);
        return kTimedOut;
    }
    // The caller holds the lock, so the record is its own.
    const bool tracked = isTracked(*target);
    const MutexRecord saved = tracked ? tessaline::readRecord(*target) : MutexRecord{};
    int result = 0;
    pthread_cleanup_push(releaseCancelledWaiter, target);
    if (timeout == 0) {
        result = pthread_cond_wait(&m_cond, &target->m_mutex);
    } else {
        const timespec deadline = deadlineAfter(timeout);
        result = pthread_cond_timedwait(&m_cond, &target->m_mutex, &deadline);
    }
    // Both outcomes give the lock back; threads that passed through the
    // mutex meanwhile have rewritten the record, and this puts the waiter
    // back in as holder with its own count.
    if (tracked && (result == 0 || result == ETIMEDOUT)) {
        tessaline::writeRecord(*target, saved);
    }
    pthread_cleanup_pop(0);
    StoreLastError(result);
    if (result == ETIMEDOUT) {
        return kTimedOut;
    }
    return CHECK_SYSERROR(result);
}

int MCondVar::Broadcast(int* /*err*/)
{
    const int result = pthread_cond_broadcast(&m_cond);
    StoreLastError(result);
    return CHECK_SYSERROR(result);
}

int MCondVar::Signal(int* /*err*/)
{
    const int result = pthread_cond_signal(&m_cond);
    StoreLastError(result);
    return CHECK_SYSERROR(result);
}

MCondVar::operator pthread_cond_t() const
{
    return m_cond;
}

void MCondVar::Cleanup(void* mutex)
{
    pthread_mutex_unlock(static_cast<pthread_mutex_t*>(mutex));
}
