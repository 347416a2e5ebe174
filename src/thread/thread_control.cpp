// MThread: acting on a running thread from outside, and the operations on
// the calling thread.
#include <cerrno>
#include <csignal>
#include <sched.h>

#include "thread/relaxed.h"
#include "thread/report.h"
#include "thread/thread_state.h"
#include "tessaline/thread/MThread.h"

using tessaline::thread::Keep;
using tessaline::thread::LoadRelaxed;
using tessaline::thread::StoreRelaxed;
using tessaline::thread::ThreadObjectLock;

namespace {

constexpr int kNotAvailable = -4;

}  // namespace

unsigned long MThread::ThreadID()
{
    return pthread_self();
}

void MThread::YieldThread()
{
    sched_yield();
}

void MThread::Exit(void* value)
{
    pthread_exit(value);
}

int MThread::Once(void (*routine)(), int* control)
{
    if (control == nullptr || routine == nullptr) {
        return CHECK_SYSERROR(EINVAL);
    }
    return CHECK_SYSERROR(pthread_once(control, routine));
}

unsigned long MThread::Self()
{
    const unsigned long self = pthread_self();
    ThreadObjectLock lock(*m_control);
    StoreRelaxed(m_thread, self);
    return self;
}

int MThread::Suspend()
{
    return kNotAvailable;
}

int MThread::Resume()
{
    return kNotAvailable;
}

void MThread::Cancel()
{
    Keep(*this, tessaline::thread::RequestCancel(*m_control, *this));
    StoreRelaxed(m_cancelled, 1);
    YieldThread();
}

int MThread::Kill(int* err)
{
    // The caller's own cancellation stays as it is: made asynchronous, a
    // later cancel of the caller could land inside malloc or a lock.
    const int result = Keep(*this, tessaline::thread::RequestCancel(*m_control, *this));
    YieldThread();
    if (err != nullptr) {
        *err = result;
    }
    return CHECK_SYSERROR(result);
}

void MThread::Priority(MThread_::ThreadPriority /*priority*/) {}

MThread_::ThreadPriority MThread::Priority()
{
    return m_priority;
}

bool MThread::Exists()
{
    ThreadObjectLock lock(*m_control);
    const unsigned long target = LoadRelaxed(m_thread);
    return target != 0 && pthread_kill(target, 0) == 0;
}

MThread::operator unsigned long() const
{
    return LoadRelaxed(m_thread);
}
