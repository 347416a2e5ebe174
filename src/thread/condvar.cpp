// MCondVar: a platform condition that waits on an MMutex and keeps a tracked
// mutex's holder record intact across the wait.
#include <cerrno>
#include <ctime>

#include "thread/mutex_record.h"
#include "thread/report.h"
#include "thread/sys.h"
#include "tessaline/thread/MThread.h"

namespace tessaline::thread {
namespace {

constexpr int kTimedOut = -5;
constexpr long kMillisecondsPerSecond = 1000;

// Clean-up of a waiter cancelled inside the platform wait, which has given
// it the mutex back: the record must not go on naming a dead thread (a
// checked mutex would refuse everyone for good), then the lock goes.
void ReleaseCancelledWaiter(void* arg)
{
    MMutex& mutex = *static_cast<MMutex*>(arg);
    if (IsTracked(mutex)) {
        HolderLock holder(mutex);
        holder.AssertHeld();
        const MutexRecord record = holder.Record();
        if (record.held == 1 && record.owner == static_cast<unsigned long>(pthread_self())) {
            holder.SetRecord(MutexRecord{0, 0, 0});
        }
    }
    MCondVar::Cleanup(&mutex.m_mutex);
}

// The deadline starts from the current whole second, so the wait may end up
// to a second early; at least one second is added.
timespec DeadlineAfter(long timeout)
{
    const long seconds = timeout / kMillisecondsPerSecond;
    timespec deadline{};
    deadline.tv_sec = std::time(nullptr) + (seconds < 1 ? 1 : seconds);
    return deadline;
}

// The platform wait on a mutex the caller holds. On 0 and ETIMEDOUT the
// caller holds it again, and a tracked mutex's record is put back as it
// entered: threads that passed through the mutex meanwhile have rewritten it.
int WaitHolding(pthread_cond_t& cond, MMutex& mutex, long timeout)
{
    HolderLock holder(mutex);
    holder.AssertHeld();
    const bool tracked = IsTracked(mutex);
    const MutexRecord saved = tracked ? holder.Record() : MutexRecord{};
    int result = 0;
    pthread_cleanup_push(ReleaseCancelledWaiter, &mutex);
    if (timeout == 0) {
        result = Sys().pthread_cond_wait(&cond, &mutex.m_mutex);
    } else {
        const timespec deadline = DeadlineAfter(timeout);
        result = Sys().pthread_cond_timedwait(&cond, &mutex.m_mutex, &deadline);
    }
    if (tracked && (result == 0 || result == ETIMEDOUT)) {
        holder.SetRecord(saved);
    }
    pthread_cleanup_pop(0);
    return result;
}

}  // namespace
}  // namespace tessaline::thread

using tessaline::thread::Keep;
using tessaline::thread::Report;
using tessaline::thread::Sys;

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
    Report(*this, Sys().pthread_condattr_init(&m_attr));
    // The last result is reported twice: as it comes, and as the status.
    const int result = Sys().pthread_cond_init(&m_cond, &m_attr);
    Report(*this, result);
    if (err != nullptr) {
        *err = errno;
    }
    return CHECK_SYSERROR(result);
}

int MCondVar::Wait(MMutex_& mutex, int* /*err*/, long timeout)
{
    auto* target = dynamic_cast<MMutex*>(&mutex);
    if (target == nullptr) {
        return Report(*this, EINVAL);
    }
    if (timeout < 0) {
        Keep(*this, ETIMEDOUT);
        return tessaline::thread::kTimedOut;
    }
    const int result = Keep(*this, tessaline::thread::WaitHolding(m_cond, *target, timeout));
    if (result == ETIMEDOUT) {
        return tessaline::thread::kTimedOut;
    }
    return Report(*this, result);
}

int MCondVar::Broadcast(int* /*err*/)
{
    return Report(*this, Sys().pthread_cond_broadcast(&m_cond));
}

int MCondVar::Signal(int* /*err*/)
{
    return Report(*this, Sys().pthread_cond_signal(&m_cond));
}

MCondVar::operator pthread_cond_t() const
{
    return m_cond;
}

void MCondVar::Cleanup(void* mutex)
{
    pthread_mutex_unlock(static_cast<pthread_mutex_t*>(mutex));
}
