// MThread: creating, running, waiting for and detaching a thread.
#include <cerrno>
#include <csignal>

#include "thread/relaxed.h"
#include "thread/report.h"
#include "thread/sys.h"
#include "thread/thread_state.h"
#include "util/load_time.h"
#include "tessaline/thread/MThread.h"

int MThread_::m_threadCnt = 0;
int MThread_::m_maxThreadCnt = 64;
MSemaphore MThread::m_thrdSemaphore TESSALINE_LOAD_TIME(64, 0);

namespace tessaline::thread {
namespace {

constexpr int kNoThread = -1;

// Holds one reference to a thread's control block for a scope; also when
// the thread leaves the scope by cancellation or Exit, which unwind it.
class ControlReference {
public:
    // Takes over a reference the caller already holds.
    explicit ControlReference(ThreadControl& control) : m_control(control) {}
    ~ControlReference() { m_control.Release(); }
    ControlReference(const ControlReference&) = delete;
    ControlReference& operator=(const ControlReference&) = delete;

private:
    ThreadControl& m_control;
};

// Detaches the thread. False when there is nothing to detach: no thread,
// detached already, or a Wait is joining it.
bool DetachLocked(ThreadControl& control, MThread& thread, int& result) TESSALINE_REQUIRES(control)
{
    const unsigned long target = LoadRelaxed(thread.m_thread);
    if (target == 0 || LoadRelaxed(thread.m_state) == kDetached || control.Joining()) {
        return false;
    }
    result = Sys().pthread_detach(target);
    if (result == 0) {
        StoreRelaxed(thread.m_state, kDetached);
        StoreRelaxed(thread.m_thread, 0UL);
    }
    return true;
}

bool Finished([[maybe_unused]] ThreadControl& control, MThread& thread) TESSALINE_REQUIRES(control)
{
    return LoadRelaxed(thread.m_finished) != 0;
}

// The end of the routine, by return: under the lock, so that a thread that
// has seen m_finished under the lock knows this thread is done with the
// object. All waiters wake: more than one thread may be in Wait.
void MarkFinished(ThreadControl& control)
{
    ThreadObjectLock lock(control);
    if (MThread* owner = control.Owner()) {
        StoreRelaxed(owner->m_finished, 1);
    }
    control.m_cond.Broadcast(nullptr);
}

// The end of the routine by cancellation or Exit. A cancelled thread can't
// be joined, so it lets itself go; done in the same span as m_finished, a
// Wait that wakes on it sees it detached.
void MarkCancelled(void* arg)
{
    ThreadControl& control = *static_cast<ThreadControl*>(arg);
    ThreadObjectLock lock(control);
    if (MThread* owner = control.Owner()) {
        StoreRelaxed(owner->m_cancelled, 1);
        int result = 0;
        if (DetachLocked(control, *owner, result)) {
            Keep(*owner, result);
        }
        StoreRelaxed(owner->m_finished, 1);
    }
    control.m_cond.Broadcast(nullptr);
}

void* RunRoutine(ThreadControl& control, void* (*routine)(void*), void* arg)
{
    if (routine == nullptr) {
        MarkFinished(control);
        // The classic "no routine" result: -1 as a pointer.
        return reinterpret_cast<void*>(-1);  // NOLINT(performance-no-int-to-ptr)
    }
    // glibc keeps its own cancellation signal out of any mask.
    sigset_t blocked;
    sigfillset(&blocked);
    sigdelset(&blocked, SIGKILL);
    pthread_sigmask(SIG_BLOCK, &blocked, nullptr);

    void* result = nullptr;
    pthread_cleanup_push(MarkCancelled, &control);
    pthread_setcanceltype(PTHREAD_CANCEL_DEFERRED, nullptr);
    pthread_setcancelstate(PTHREAD_CANCEL_ENABLE, nullptr);
    result = routine(arg);
    pthread_setcancelstate(PTHREAD_CANCEL_DISABLE, nullptr);
    pthread_cleanup_pop(0);

    MarkFinished(control);
    return result;
}

// The start routine of a created thread, with the reference that Create
// took for it.
void* StartRoutine(void* arg)
{
    ThreadControl& control = *static_cast<ThreadControl*>(arg);
    ControlReference reference(control);
    return RunRoutine(control, control.m_routine, control.m_arg);
}

// Clears the joining mark when the join ends, also when the waiting thread
// is cancelled inside it.
class JoinMark {
public:
    explicit JoinMark(ThreadControl& control) : m_control(control) {}
    ~JoinMark()
    {
        ThreadObjectLock lock(m_control);
        m_control.SetJoining(false);
    }
    JoinMark(const JoinMark&) = delete;
    JoinMark& operator=(const JoinMark&) = delete;

private:
    ThreadControl& m_control;
};

// Waits on the condition until the thread is marked finished: 0, or -5 or
// -1 with the code of the failing object in the thread's m_lastError. The
// condition wait's clean-up handler releases the lock if the waiting thread
// is cancelled, which is why no scoped lock is used here.
int WaitFinished(ThreadControl& control, MThread& thread, long timeout)
{
    if (thread.m_mutex->Lock(nullptr) != 0) {
        Keep(thread, LoadRelaxed(thread.m_mutex->m_lastError));
        return kNoThread;
    }
    control.AssertHeld();
    int status = 0;
    while (!Finished(control, thread) && status == 0) {
        status = thread.m_cond->Wait(*thread.m_mutex, nullptr, timeout);
    }
    thread.m_mutex->Unlock(nullptr);
    if (status != 0) {
        Keep(thread, LoadRelaxed(thread.m_cond->m_lastError));
    }
    return status;
}

// The join of a thread that Wait found still joinable: 0 or the platform
// result, with the routine's result in *value.
int Join(ThreadControl& control, MThread& thread, unsigned long target, void** value)
{
    JoinMark mark(control);
    const int result = Sys().pthread_join(target, value);
    if (result == 0) {
        ThreadObjectLock lock(control);
        if (LoadRelaxed(thread.m_thread) == target) {
            StoreRelaxed(thread.m_thread, 0UL);
        }
    }
    return result;
}

}  // namespace

int RequestCancel(ThreadControl& control, MThread& thread)
{
    // Under the lock the identifier can't go stale: a thread that detaches
    // itself does so under this lock, and its identifier is gone with it.
    ThreadObjectLock lock(control);
    const unsigned long target = LoadRelaxed(thread.m_thread);
    return target == 0 ? ESRCH : Sys().pthread_cancel(target);
}

}  // namespace tessaline::thread

using tessaline::thread::kDetached;
using tessaline::thread::Keep;
using tessaline::thread::kJoinable;
using tessaline::thread::kNoThreadCreated;
using tessaline::thread::LoadRelaxed;
using tessaline::thread::Report;
using tessaline::thread::StoreRelaxed;
using tessaline::thread::ThreadControl;
using tessaline::thread::ThreadObjectLock;

MThread_::MThread_(ThreadPriority priority) : m_state(kNoThreadCreated), m_priority(priority)
{
    __atomic_add_fetch(&m_threadCnt, 1, __ATOMIC_RELAXED);
}

MThread_::MThread_(const MThread_& other)
    : MThreadError(other), m_state(LoadRelaxed(other.m_state)), m_priority(other.m_priority)
{
    __atomic_add_fetch(&m_threadCnt, 1, __ATOMIC_RELAXED);
}

MThread_::~MThread_()
{
    __atomic_sub_fetch(&m_threadCnt, 1, __ATOMIC_RELAXED);
}

// If the allocation throws, the base's destructor puts the count back.
MThread::MThread(MThread_::ThreadPriority priority)
    : MThread_(priority),
      m_cond(nullptr),
      m_mutex(nullptr),
      m_routine(nullptr),
      m_arg(nullptr),
      m_finished(0),
      m_cancelled(0),
      m_attr(),
      m_thread(0),
      m_control(new ThreadControl(*this))
{
    m_cond = &m_control->m_cond;
    m_mutex = &m_control->m_mutex;
}

MThread::MThread(const MThread& other)
    : MThread_(other),
      m_cond(nullptr),
      m_mutex(nullptr),
      m_routine(other.m_routine),
      m_arg(other.m_arg),
      m_finished(LoadRelaxed(other.m_finished)),
      m_cancelled(LoadRelaxed(other.m_cancelled)),
      m_attr(other.m_attr),
      m_thread(LoadRelaxed(other.m_thread)),
      m_control(new ThreadControl(*this))
{
    m_cond = &m_control->m_cond;
    m_mutex = &m_control->m_mutex;
}

MThread& MThread::operator=(const MThread& other)
{
    if (this == &other) {
        return *this;
    }
    m_routine = other.m_routine;
    m_arg = other.m_arg;
    StoreRelaxed(m_cancelled, LoadRelaxed(other.m_cancelled));
    StoreRelaxed(m_thread, LoadRelaxed(other.m_thread));
    m_attr = other.m_attr;
    StoreRelaxed(m_finished, LoadRelaxed(other.m_finished));
    return *this;
}

MThread::~MThread()
{
    {
        ThreadObjectLock lock(*m_control);
        // Only a thread this object created is let go; an adopted one (Self)
        // belongs to whoever made it.
        if (LoadRelaxed(m_state) == kJoinable && LoadRelaxed(m_thread) != 0) {
            pthread_attr_destroy(&m_attr);
            int result = 0;
            tessaline::thread::DetachLocked(*m_control, *this, result);
        }
        // From here on the thread, if it still runs, leaves this object alone.
        m_control->Disown();
    }
    m_control->Release();
}

int MThread::Create(void* (*routine)(void*), void* arg, int stackSize, int detached, int, int*)
{
    if (LoadRelaxed(m_state) != kNoThreadCreated) {
        return Report(*this, EBUSY);
    }
    m_routine = routine;
    m_arg = arg;
    // The attribute calls can only refuse a value; the default then stands.
    pthread_attr_init(&m_attr);
    if (stackSize != 0) {
        pthread_attr_setstacksize(&m_attr, static_cast<size_t>(stackSize));
    }
    pthread_attr_setdetachstate(&m_attr, detached == 1 ? PTHREAD_CREATE_DETACHED : PTHREAD_CREATE_JOINABLE);
    pthread_attr_setscope(&m_attr, PTHREAD_SCOPE_SYSTEM);
    int result = 0;
    {
        // The new thread reads m_state and m_thread under this lock when it
        // goes out through CancelThread; it finds them set.
        ThreadObjectLock lock(*m_control);
        m_control->m_routine = routine;
        m_control->m_arg = arg;
        m_control->Retain();
        pthread_t id = 0;
        result = tessaline::thread::Sys().pthread_create(&id, &m_attr, tessaline::thread::StartRoutine, m_control);
        if (result == 0) {
            StoreRelaxed(m_state, detached == 1 ? kDetached : kJoinable);
            StoreRelaxed(m_thread, detached == 1 ? 0UL : id);
        } else {
            m_control->Release();
        }
    }
    if (result == 0) {
        Priority(m_priority);
    }
    return Report(*this, result);
}

void* MThread::ThreadRoutineWrapper(MThread* thread)
{
    ThreadControl& control = *thread->m_control;
    control.Retain();
    tessaline::thread::ControlReference reference(control);
    return tessaline::thread::RunRoutine(control, thread->m_routine, thread->m_arg);
}

void MThread::CancelThread(void* thread)
{
    tessaline::thread::MarkCancelled(static_cast<MThread*>(thread)->m_control);
}

int MThread::Wait(int** retval, int* /*err*/, long timeout)
{
    {
        // Under the lock: a -1 here also means that a thread which detached
        // itself has finished with the object.
        ThreadObjectLock lock(*m_control);
        if (LoadRelaxed(m_thread) == 0) {
            return tessaline::thread::kNoThread;
        }
    }
    if (timeout != -1) {
        const int status = tessaline::thread::WaitFinished(*m_control, *this, timeout);
        if (status != 0) {
            return status;
        }
    }
    unsigned long target = 0;
    {
        ThreadObjectLock lock(*m_control);
        if (LoadRelaxed(m_state) == kDetached) {
            return kDetached;
        }
        target = LoadRelaxed(m_thread);
        if (target == 0) {
            return tessaline::thread::kNoThread;
        }
        if (m_control->Joining()) {
            return Report(*this, EINVAL);
        }
        m_control->SetJoining(true);
    }
    void* value = nullptr;
    const int result = tessaline::thread::Join(*m_control, *this, target, &value);
    if (result == 0 && retval != nullptr) {
        *retval = static_cast<int*>(value);
    }
    return Report(*this, result);
}

int MThread::Detach()
{
    int result = 0;
    bool attempted = false;
    {
        ThreadObjectLock lock(*m_control);
        if (m_control->Joining() && LoadRelaxed(m_thread) != 0 && LoadRelaxed(m_state) != kDetached) {
            result = EINVAL;
            attempted = true;
        } else {
            attempted = tessaline::thread::DetachLocked(*m_control, *this, result);
        }
    }
    return Report(*this, attempted ? result : LoadRelaxed(m_lastError));
}
