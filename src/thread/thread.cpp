// MThread: creating, running, waiting for and detaching a thread.
#include <cerrno>
#include <csignal>
#include <memory>

#include "thread/relaxed.h"
#include "thread/thread_state.h"
#include "util/load_time.h"
#include "tessaline/thread/MThread.h"

using tessaline::kDetached;
using tessaline::kJoinable;
using tessaline::kNoThreadCreated;
using tessaline::loadRelaxed;
using tessaline::storeRelaxed;
using tessaline::ThreadObjectLock;

int MThread_::m_threadCnt = 0;
int MThread_::m_maxThreadCnt = 64;
MSemaphore MThread::m_thrdSemaphore TESSALINE_LOAD_TIME(64, 0);

namespace {

constexpr int kNoThread = -1;

void* startRoutine(void* thread)
{
    return MThread::ThreadRoutineWrapper(static_cast<MThread*>(thread));
}

// Under the lock, so that a thread that has seen m_finished under the lock
// knows this thread is done with the object. All waiters wake: more than one
// thread may be in Wait.
void markFinished(MThread& thread)
{
    ThreadObjectLock lock(thread);
    storeRelaxed(thread.m_finished, 1);
    thread.m_cond->Broadcast(nullptr);
}

// Detaches under the object's lock. False when there is nothing to detach:
// no thread, detached already, or a Wait is joining it (the joiner reaps it;
// detaching under a joiner is undefined).
bool detachLocked(MThread& thread, int& result)
{
    const unsigned long target = loadRelaxed(thread.m_thread);
    if (target == 0 || loadRelaxed(thread.m_state) == kDetached || thread.m_joining != 0) {
        return false;
    }
    result = pthread_detach(target);
    if (result == 0) {
        storeRelaxed(thread.m_state, kDetached);
        storeRelaxed(thread.m_thread, 0UL);
    }
    return true;
}

}  // namespace

namespace tessaline {

ThreadObjectLock::ThreadObjectLock(MThread& thread) : m_mutex(thread.m_mutex->m_mutex), m_oldCancelState(0)
{
    pthread_setcancelstate(PTHREAD_CANCEL_DISABLE, &m_oldCancelState);
    pthread_mutex_lock(&m_mutex);
}

ThreadObjectLock::~ThreadObjectLock()
{
    pthread_mutex_unlock(&m_mutex);
    pthread_setcancelstate(m_oldCancelState, &m_oldCancelState);
}

int requestCancel(MThread& thread)
{
    // Under the lock the identifier can't go stale: a thread that detaches
    // itself does so under this lock, and its identifier is gone with it.
    ThreadObjectLock lock(thread);
    const unsigned long target = loadRelaxed(thread.m_thread);
    return target == 0 ? ESRCH : pthread_cancel(target);
}

}  // namespace tessaline

MThread_::MThread_(ThreadPriority priority) : m_state(kNoThreadCreated), m_priority(priority)
{
    __atomic_add_fetch(&m_threadCnt, 1, __ATOMIC_RELAXED);
}

MThread_::MThread_(const MThread_& other)
    : MThreadError(other), m_state(loadRelaxed(other.m_state)), m_priority(other.m_priority)
{
    __atomic_add_fetch(&m_threadCnt, 1, __ATOMIC_RELAXED);
}

MThread_::~MThread_()
{
    __atomic_sub_fetch(&m_threadCnt, 1, __ATOMIC_RELAXED);
}

// If an allocation throws, the base's destructor puts the count back.
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
      m_joining(0)
{
    auto mutex = std::make_unique<MMutex>(MMutex_::MutexPlain);
    m_cond = new MCondVar;
    m_mutex = mutex.release();
}

MThread::MThread(const MThread& other)
    : MThread_(other),
      m_cond(nullptr),
      m_mutex(nullptr),
      m_routine(other.m_routine),
      m_arg(other.m_arg),
      m_finished(loadRelaxed(other.m_finished)),
      m_cancelled(loadRelaxed(other.m_cancelled)),
      m_attr(other.m_attr),
      m_thread(loadRelaxed(other.m_thread)),
      m_joining(0)
{
    auto mutex = std::make_unique<MMutex>(MMutex_::MutexPlain);
    m_cond = new MCondVar;
    m_mutex = mutex.release();
}

MThread& MThread::operator=(const MThread& other)
{
    if (this == &other) {
        return *this;
    }
    m_routine = other.m_routine;
    m_arg = other.m_arg;
    storeRelaxed(m_cancelled, loadRelaxed(other.m_cancelled));
    storeRelaxed(m_thread, loadRelaxed(other.m_thread));
    m_attr = other.m_attr;
    storeRelaxed(m_finished, loadRelaxed(other.m_finished));
    return *this;
}

MThread::~MThread()
{
    // Only a thread this object created is let go; an adopted one (Self)
    // belongs to whoever made it.
    if (loadRelaxed(m_state) == kJoinable && loadRelaxed(m_thread) != 0) {
        pthread_attr_destroy(&m_attr);
        Detach();
    }
    delete m_mutex;
    delete m_cond;
}

int MThread::Create(void* (*routine)(void*), void* arg, int stackSize, int detached, int, int*)
{
    if (loadRelaxed(m_state) != kNoThreadCreated) {
        StoreLastError(EBUSY);
        return CHECK_SYSERROR(EBUSY);
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
        ThreadObjectLock lock(*this);
        pthread_t id = 0;
        result = pthread_create(&id, &m_attr, startRoutine, this);
        if (result == 0) {
            storeRelaxed(m_state, detached == 1 ? kDetached : kJoinable);
            storeRelaxed(m_thread, detached == 1 ? 0UL : id);
        }
    }
    StoreLastError(result);
    if (result == 0) {
        Priority(m_priority);
    }
    return CHECK_SYSERROR(result);
}

void* MThread::ThreadRoutineWrapper(MThread* thread)
{
    if (thread->m_routine == nullptr) {
        markFinished(*thread);
        // The classic "no routine" result: -1 as a pointer.
        return reinterpret_cast<void*>(-1);  // NOLINT(performance-no-int-to-ptr)
    }
    // glibc keeps its own cancellation signal out of any mask.
    sigset_t blocked;
    sigfillset(&blocked);
    sigdelset(&blocked, SIGKILL);
    pthread_sigmask(SIG_BLOCK, &blocked, nullptr);

    void* result = nullptr;
    pthread_cleanup_push(CancelThread, thread);
    pthread_setcanceltype(PTHREAD_CANCEL_DEFERRED, nullptr);
    pthread_setcancelstate(PTHREAD_CANCEL_ENABLE, nullptr);
    result = thread->m_routine(thread->m_arg);
    pthread_setcancelstate(PTHREAD_CANCEL_DISABLE, nullptr);
    pthread_cleanup_pop(0);

    markFinished(*thread);
    return result;
}

void MThread::CancelThread(void* arg)
{
    MThread& thread = *static_cast<MThread*>(arg);
    storeRelaxed(thread.m_cancelled, 1);
    ThreadObjectLock lock(thread);
    // A cancelled thread can't be joined, so it lets itself go; done in the
    // same span as m_finished, a Wait that wakes on it sees it detached.
    int result = 0;
    if (detachLocked(thread, result)) {
        thread.StoreLastError(result);
    }
    storeRelaxed(thread.m_finished, 1);
    thread.m_cond->Broadcast(nullptr);
}

namespace {

// Clears the joining mark when the join ends, also when the waiting thread
// is cancelled inside it.
class JoinMark {
public:
    explicit JoinMark(MThread& thread) : m_thread(thread) {}
    ~JoinMark()
    {
        ThreadObjectLock lock(m_thread);
        m_thread.m_joining = 0;
    }
    JoinMark(const JoinMark&) = delete;
    JoinMark& operator=(const JoinMark&) = delete;

private:
    MThread& m_thread;
};

// Waits on the condition until the thread is marked finished: 0, or -5 or
// -1 with the code of the failing object in the thread's m_lastError. The
// condition wait's clean-up handler releases the lock if the waiting thread
// is cancelled, which is why no scoped lock is used here.
int waitFinished(MThread& thread, long timeout)
{
    if (thread.m_mutex->Lock(nullptr) != 0) {
        thread.StoreLastError(loadRelaxed(thread.m_mutex->m_lastError));
        return kNoThread;
    }
    int status = 0;
    while (loadRelaxed(thread.m_finished) == 0 && status == 0) {
        status = thread.m_cond->Wait(*thread.m_mutex, nullptr, timeout);
    }
    thread.m_mutex->Unlock(nullptr);
    if (status != 0) {
        thread.StoreLastError(loadRelaxed(thread.m_cond->m_lastError));
    }
    return status;
}

}  // namespace

int MThread::Wait(int** retval, int* /*err*/, long timeout)
{
    {
        // Under the lock: a -1 here also means that a thread which detached
        // itself has finished with the object.
        ThreadObjectLock lock(*this);
        if (loadRelaxed(m_thread) == 0) {
            return kNoThread;
        }
    }
    if (timeout != -1) {
        const int status = waitFinished(*this, timeout);
        if (status != 0) {
            return status;
        }
    }
    unsigned long target = 0;
    {
        ThreadObjectLock lock(*this);
        if (loadRelaxed(m_state) == kDetached) {
            return kDetached;
        }
        target = loadRelaxed(m_thread);
        if (target == 0) {
            return kNoThread;
        }
        if (m_joining != 0) {
            StoreLastError(EINVAL);
            return CHECK_SYSERROR(EINVAL);
        }
        m_joining = 1;
    }
    void* value = nullptr;
    int result = 0;
    {
        JoinMark mark(*this);
        result = pthread_join(target, &value);
        if (result == 0) {
            ThreadObjectLock lock(*this);
            if (loadRelaxed(m_thread) == target) {
                storeRelaxed(m_thread, 0UL);
            }
        }
    }
    if (result == 0 && retval != nullptr) {
        *retval = static_cast<int*>(value);
    }
    StoreLastError(result);
    return CHECK_SYSERROR(result);
}

int MThread::Detach()
{
    int result = 0;
    bool attempted = false;
    {
        ThreadObjectLock lock(*this);
        if (m_joining != 0 && loadRelaxed(m_thread) != 0 && loadRelaxed(m_state) != kDetached) {
            result = EINVAL;
            attempted = true;
        } else {
            attempted = detachLocked(*this, result);
        }
    }
    if (attempted) {
        StoreLastError(result);
    } else {
        result = loadRelaxed(m_lastError);
    }
    return CHECK_SYSERROR(result);
}
