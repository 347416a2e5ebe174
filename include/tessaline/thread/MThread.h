/**
 * @file
 * @brief Thread objects over POSIX threads: mutexes, condition variables,
 * semaphores, thread keys and threads.
 *
 * Every class here derives from MThreadError and reports in one way: the
 * outcome of the last platform call is kept in m_lastError, a failure that
 * CHECK_SYSERROR does not consider routine is written as one line on stderr,
 * and a status code comes back to the caller. Nothing here throws, aborts or
 * exits on a failed platform call.
 *
 * Status codes:
 *
 * | Code | Meaning                                                           |
 * |------|-------------------------------------------------------------------|
 * |  0   | success                                                           |
 * | -1   | a platform call failed (see LastError); MThread::Wait: no thread  |
 * |  2   | MMutex: a MutexChecked mutex is already held                      |
 * |  3   | MMutex::Unlock: the tracked mutex is not held; MThread::Wait: the thread is detached |
 * | -2   | MMutex::Unlock: the caller is not the holder                      |
 * | -4   | MThread::Suspend, MThread::Resume: not available on this platform |
 * | -5   | MCondVar::Wait, MThread::Wait: the time given ran out             |
 * | -6   | MThread::Pause: the pause ended because the thread was cancelled  |
 *
 * With 2, 3 and -2, m_lastError holds -2.
 *
 * Thread safety: every operation may be called from any thread once the
 * object is constructed. m_lastError is shared by all callers of an object:
 * after concurrent failures it shows whichever call wrote last, so LastError
 * is only meaningful to a thread that is the sole user at that moment.
 */
#ifndef TESSALINE_THREAD_MTHREAD_H
#define TESSALINE_THREAD_MTHREAD_H

#include <pthread.h>
#include <semaphore.h>

#include "tessaline/export.h"

namespace tessaline::thread {
class ThreadControl;
}  // namespace tessaline::thread

/// Passes a thread-library result through the reporting rule: 0 gives 0;
/// ENOENT, ESRCH and EAGAIN give -1 silently; any other value, negative ones
/// too, writes "Thread #%d error: %s (%d)\n" to stderr and gives -1. The
/// thread identifier is printed through "%d", so on x86-64 the line shows the
/// low 32 bits of pthread_self().
TESSALINE_API int CHECK_SYSERROR(int err);

/// Base of all thread classes: the code of the last operation on the object.
class TESSALINE_API MThreadError {
public:
    /// Starts with m_lastError 0.
    MThreadError();

    /// The code of the last operation: a platform result, errno for the
    /// semaphore calls, or a negative code of this subsystem.
    virtual int LastError();

    /// strerror(m_lastError). The text belongs to the C library and is valid
    /// until the next strerror call in any thread.
    virtual char* LastErrorText();

    /// Writes m_lastError without a data race when several threads report
    /// through one object; the last writer wins, as documented above.
    void StoreLastError(int code);

    /// The code of the last operation, 0 after success; see LastError. Shared
    /// by all threads that use the object.
    int m_lastError;
};

/// Abstract mutex interface; MMutex implements it. It has no virtual
/// destructor: delete a mutex through its concrete type.
class TESSALINE_API MMutex_ : public MThreadError {
public:
    /// How a mutex behaves when it is taken again while held.
    enum MutexType : int {
        MutexPlain = 0,     ///< Straight to the platform mutex.
        MutexChecked = 1,   ///< Refuses (status 2) while held, never queues.
        MutexRecursive = 2  ///< The holder re-enters and counts.
    };

    /// An unlocked record of type MutexPlain; the concrete class sets the type.
    MMutex_();

    /// (Re)initialises the mutex as `type`; 0 or -1.
    virtual int Create(MutexType type, int* err) = 0;
    /// Takes the mutex if that is possible without waiting; 0, 2 or -1.
    virtual int Try(int* err) = 0;
    /// Takes the mutex, waiting as long as it takes; 0, 2 or -1.
    virtual int Lock(int* err) = 0;
    /// Releases the mutex; 0, 3, -2 or -1.
    virtual int Unlock(int* err) = 0;

    /// The type given to Create.
    MutexType m_type;
    /// 1 while a tracked mutex is held; written on every tracked acquisition
    /// and final release. Read it through Locked().
    int m_locked;

    /// m_locked, read without a data race: 1 while a tracked mutex is held.
    /// A plain mutex always reads 0.
    int Locked() const;
};

/**
 * A mutex with plain, checked and recursive modes. The checked and
 * recursive ("tracked") modes keep a record of the holder (m_count, m_owner,
 * m_held). Only the thread that holds m_mutex writes it, so the holder's
 * acquisition, re-entry and release need no other lock; its fields are
 * accessed atomically. Other threads look at it under the inner m_guard,
 * which is held only for short spans and never while blocking on m_mutex.
 *
 * `err`, where given, receives errno just before the call returns, except
 * on a recursive re-entry and on an Unlock by a non-holder.
 *
 * Typical use:
 * @code
 *   MMutex mutex(MMutex_::MutexRecursive);
 *   if (mutex.Lock(nullptr) == 0) { ...; mutex.Unlock(nullptr); }
 * @endcode
 */
class TESSALINE_API MMutex : public MMutex_ {
public:
    /// Creates the mutex as `type` (Create(type, nullptr)); it is ready at
    /// once. A failure shows in LastError.
    explicit MMutex(MMutex_::MutexType type);

    /// Initialises the attribute object, m_mutex and m_guard and clears the
    /// record. Calling it again re-initialises without destroying. `err` is
    /// not written.
    int Create(MMutex_::MutexType type, int* err) override;

    /// Like Lock, but never blocks: a mutex held by another thread gives -1
    /// with EBUSY in m_lastError (and the CHECK_SYSERROR line); a held
    /// MutexChecked gives 2. Clears m_lastError first.
    int Try(int* err) override;

    /// 0 once held. MutexChecked with a holder recorded: 2 at once, for the
    /// holder and every other thread. MutexRecursive re-entered by its
    /// holder: 0 with m_count raised, m_lastError untouched. A type outside
    /// 0..2 takes nothing and reports the current m_lastError.
    int Lock(int* err) override;

    /// 0 once released (a recursive holder must unlock as often as it
    /// locked). Tracked mutex not held: 3. Caller not the holder: -2, the
    /// lock stays. Both refusals leave -2 in m_lastError and print nothing.
    int Unlock(int* err) override;

    /// Destroys the attribute object and both platform mutexes. Destroying a
    /// held mutex is not detected.
    virtual ~MMutex();

    /// A platform mutex can't be copied; neither can this.
    ///@{
    MMutex(const MMutex&) = delete;
    MMutex& operator=(const MMutex&) = delete;
    ///@}

    /// A copy by value of the platform mutex, as the classic interface has it.
    operator pthread_mutex_t() const;

    pthread_mutexattr_t m_attr;  ///< The attribute object of m_mutex; it sets nothing.
    pthread_mutex_t m_mutex;     ///< The lock that callers contend for.
    pthread_mutex_t m_guard;     ///< Guards other threads' looks at the record; held briefly.
    int m_count;                 ///< How often the holder has taken a tracked mutex.
    unsigned long m_owner;       ///< The holder's pthread_self(), 0 when free.
    int m_held;                  ///< 1 while the record names a holder.
};

/// Abstract condition variable interface; MCondVar implements it.
class TESSALINE_API MCondVar_ : public MThreadError {
public:
    /// Nothing to set up.
    MCondVar_();
    /// Initialises the platform condition; 0 or -1.
    virtual int Create(int* err) = 0;
    /// Waits on `mutex`, held by the caller, for a signal or `timeout`
    /// milliseconds (0: no limit); 0, -5 or -1.
    virtual int Wait(MMutex_& mutex, int* err, long timeout) = 0;
    /// Wakes all waiters; 0 or -1.
    virtual int Broadcast(int* err) = 0;
    /// Wakes one waiter; 0 or -1.
    virtual int Signal(int* err) = 0;
};

/**
 * A condition variable that waits on an MMutex, with a timeout in
 * milliseconds of whole-second grain. Wait has no loop against spurious
 * wake-ups: callers test their own condition.
 *
 * Typical use:
 * @code
 *   mutex.Lock(nullptr);
 *   while (!ready && cond.Wait(mutex, nullptr, 0) == 0) {}
 *   mutex.Unlock(nullptr);
 * @endcode
 */
class TESSALINE_API MCondVar : public MCondVar_ {
public:
    /// Creates the condition (Create(nullptr)); a failure shows in LastError.
    MCondVar();

    /// Initialises the attribute object and the platform condition. Each
    /// step's result goes through CHECK_SYSERROR, so a failed second step
    /// writes its line twice. `err`, if given, receives errno.
    int Create(int* err) override;

    /// Waits until signalled (timeout 0) or until the time runs out. The
    /// caller holds `mutex`, which must be an MMutex (anything else: -1 with
    /// EINVAL). Returns 0 when woken, -5 when the time ran out (ETIMEDOUT in
    /// m_lastError, nothing on stderr), -1 on a platform failure. On 0 and -5
    /// the caller holds the mutex again, and a checked or recursive mutex has
    /// its record back as it entered (holder and count), even if other threads
    /// passed through the mutex meanwhile, so a later Unlock works.
    ///
    /// The deadline is the current wall-clock second plus timeout / 1000 whole
    /// seconds, at least one: 1 to 1999 ms wait at most one second, 2500 ms
    /// between one and two. A negative timeout is an immediate timeout: -5 at
    /// once, the mutex never released. `err` has no effect.
    ///
    /// The wait is a cancellation point. A thread cancelled in it releases the
    /// mutex completely, and a tracked mutex that still records that thread as
    /// holder is recorded free, so it doesn't refuse or wait for a dead thread.
    int Wait(MMutex_& mutex, int* err, long timeout) override;

    /// Wake all waiters (Broadcast) or one (Signal): 0, or -1 on a platform
    /// failure. `err` has no effect.
    ///@{
    int Broadcast(int* err) override;
    int Signal(int* err) override;
    ///@}

    /// Destroys the attribute object, then the condition; results ignored.
    virtual ~MCondVar();

    /// A platform condition can't be copied; neither can this.
    ///@{
    MCondVar(const MCondVar&) = delete;
    MCondVar& operator=(const MCondVar&) = delete;
    ///@}

    /// A copy by value of the platform condition, as the classic interface has it.
    operator pthread_cond_t() const;

    /// A clean-up handler for host code: unlocks the pthread_mutex_t given.
    static void Cleanup(void* mutex);

    pthread_cond_t m_cond;      ///< The platform condition.
    pthread_condattr_t m_attr;  ///< Its attribute object; it sets nothing.
};

/// Abstract counting semaphore interface; MSemaphore implements it.
class TESSALINE_API MSemaphore_ : public MThreadError {
public:
    /// Nothing to set up.
    MSemaphore_();
    /// (Re)makes the semaphore with `count`; 0 or -1.
    virtual int Init(long count) = 0;
    /// Takes one count, waiting for it; 0 or -1.
    virtual int Wait() = 0;
    /// Takes one count if there is one; 0 or -1.
    virtual int Try() = 0;
    /// Gives one count back; 0 or -1.
    virtual int Signal() = 0;
    /// The current count; this base has none to give and returns -1.
    virtual long Count();
};

/**
 * A counting semaphore of one process (shared 0) or shared between
 * processes. The semaphore calls report errno, so m_lastError holds an errno
 * value after a failure.
 *
 * A semaphore made with a count of 0 or less has no platform object until
 * Init. Until then Wait, Try and Signal return -1 with EINVAL (and the
 * CHECK_SYSERROR line), Count returns -1, and the destructor leaves the
 * platform alone.
 */
class TESSALINE_API MSemaphore : public MSemaphore_ {
public:
    /// Calls Init(count) if count is above 0.
    MSemaphore(long count, int shared) noexcept;

    /// Makes the platform semaphore with `count`, limited to 32767. A count
    /// below 0 is refused: -1 with EINVAL, and no platform object. Init on a
    /// semaphore that already exists destroys it first: no thread may be
    /// waiting on it.
    int Init(long count) override;

    /// Takes one count, waiting as long as it takes; a signal handler running
    /// in between doesn't end the wait. A cancellation point: a thread
    /// cancelled while it waits takes no count.
    int Wait() override;

    /// Takes one count if there is one. An empty semaphore gives -1 at once
    /// with EAGAIN in m_lastError and writes nothing.
    int Try() override;

    /// Gives one count back: 0, or -1 on a platform failure.
    int Signal() override;

    /// The current count, or -1 if there is no platform object or the platform
    /// refuses. m_lastError is not touched.
    long Count() override;

    /// m_lastError takes the result of destroying the platform semaphore, if
    /// there is one.
    virtual ~MSemaphore();

    /// A platform semaphore can't be copied; neither can this.
    ///@{
    MSemaphore(const MSemaphore&) = delete;
    MSemaphore& operator=(const MSemaphore&) = delete;
    ///@}

    /// A copy by value of the platform semaphore, as the classic interface has it.
    operator sem_t() const;

    /// A clean-up handler for host code: posts the sem_t given.
    static void Cleanup(void* sem);

    int m_shared;  ///< 0: one process; otherwise shared between processes.
    sem_t m_sem;   ///< The platform semaphore, valid once Init succeeded.

private:
    bool m_bInitialised;
};

/// Abstract thread-specific data interface; MThreadKey implements it.
class TESSALINE_API MThreadKey_ : public MThreadError {
public:
    /// Nothing to set up.
    MThreadKey_();
    /// Makes the key, with a destructor for the threads' values; 0 or -1.
    virtual int Create(void (*destructor)(), int, int*) = 0;
    /// Sets the calling thread's value; 0 or -1.
    virtual int SetValue(void* value, int* err) = 0;
    /// The calling thread's value, or null.
    virtual void* GetValue(int* err) = 0;
};

/**
 * One key of thread-specific data: each thread sees its own value, null
 * until it sets one.
 *
 * The platform may hand out 0 as a real key; the object keeps a mark of its
 * own for whether it has a key, so such a key is used and deleted like any
 * other. The object owns its key and deletes it with itself.
 */
class TESSALINE_API MThreadKey : public MThreadKey_ {
public:
    /// An object without a key: call Create before use.
    MThreadKey();

    /// Makes the key. `destructor` (may be null) is handed to the platform,
    /// which calls it at a thread's exit with that thread's non-null value as
    /// its one argument: pass a void (*)(void*) cast to this type. Create on
    /// an object that already has a key deletes that key first. The last two
    /// arguments have no effect.
    int Create(void (*destructor)(), int, int*) override;

    /// Sets the calling thread's value. Without a key: -1 with EINVAL, so a
    /// value never lands under a key that belongs to someone else. `err` has
    /// no effect.
    int SetValue(void* value, int* err) override;

    /// The calling thread's value; null if it set none or there is no key.
    /// m_lastError is not touched; `err` has no effect.
    void* GetValue(int* err) override;

    /// Deletes the key, if there is one. The values' destructors don't run.
    virtual ~MThreadKey();

    /// A key is owned by one object; it can't be copied.
    ///@{
    MThreadKey(const MThreadKey&) = delete;
    MThreadKey& operator=(const MThreadKey&) = delete;
    ///@}

    /// The platform key; 0 also when there is none.
    operator unsigned int() const;

    /// The platform key; meaningful only once Create has succeeded.
    unsigned int m_key;

private:
    bool m_bHasKey;
};

/// Abstract thread interface, and the count of thread objects. MThread
/// implements it; the operations are described there.
class TESSALINE_API MThread_ : public MThreadError {
public:
    /// Stored and read back; nothing maps it to a platform priority.
    enum ThreadPriority : int {
        PriorityLowest = -2,  ///< Lowest.
        PriorityLow = -1,     ///< Below normal.
        PriorityNormal = 0,   ///< Normal, the default.
        PriorityHigh = 1,     ///< Above normal.
        PriorityHighest = 2   ///< Highest.
    };

    /// Both constructors count the object in m_threadCnt; the destructor
    /// counts it out. The copy takes m_lastError, m_state and m_priority.
    ///@{
    explicit MThread_(ThreadPriority priority);
    MThread_(const MThread_& other);
    ///@}
    /// Copies m_lastError, m_state and m_priority; the count stays.
    MThread_& operator=(const MThread_& other) = default;

    /// Counts the object out of m_threadCnt.
    virtual ~MThread_();
    /// Starts `routine(arg)` in a new thread; 0 or -1.
    virtual int Create(void* (*routine)(void*), void* arg, int stackSize, int detached, int, int*) = 0;
    /// Makes the object stand for the calling thread; returns its identifier.
    virtual unsigned long Self() = 0;
    /// Suspends the thread, where the platform can; -4 where it can't.
    virtual int Suspend() = 0;
    /// Resumes a suspended thread, where the platform can; -4 where it can't.
    virtual int Resume() = 0;
    /// Detaches the thread; 0 or -1.
    virtual int Detach() = 0;
    /// Asks the thread to stop; the outcome shows in LastError.
    virtual void Cancel() = 0;
    /// Stops the thread as firmly as the platform allows; 0 or -1.
    virtual int Kill(int* err) = 0;
    /// Waits for the thread, up to `timeout` milliseconds, and joins it; 0, 3, -5 or -1.
    virtual int Wait(int** retval, int* err, long timeout) = 0;
    /// For the routine: pauses up to `milliseconds` unless cancelled; returns
    /// whether the object is cancelled.
    virtual int Cancelled(int* err, int milliseconds) = 0;
    /// Sets the priority, where the implementation supports it.
    virtual void Priority(ThreadPriority priority) = 0;
    /// The priority.
    virtual ThreadPriority Priority() = 0;
    /// True while the object has a thread that the platform knows.
    virtual bool Exists() = 0;

    /// 0: no thread created by this object; 1: a joinable thread was created;
    /// 3: the thread is detached.
    int m_state;
    /// The priority given to the constructor.
    ThreadPriority m_priority;

    /// Thread objects alive. Read it with an atomic load if other threads may
    /// be making or destroying objects at the same time.
    static int m_threadCnt;
    /// 64, for the host; nothing here reads it.
    static int m_maxThreadCnt;
};

/**
 * One thread as an object: Create starts a routine in a new thread, Wait
 * waits for it with a timeout and joins it, Cancel asks it to stop, and the
 * routine itself can pause in a way that a Cancel ends (Pause, Cancelled).
 *
 * The object may be destroyed at any time, also while its thread runs: the
 * destructor detaches a thread that nobody joined, and the thread, when its
 * routine ends, no longer touches the object (m_finished and m_cancelled of
 * a destroyed object are simply not written). The routine itself must not
 * use an object it knows may be gone. One object starts one thread.
 *
 * Every created thread runs with all signals blocked but SIGKILL, and with
 * deferred cancellation: it ends at its next cancellation point (a sleep, a
 * wait, Pause) or sees the request through Cancelled. A thread that is
 * cancelled or calls Exit goes out through CancelThread: it is marked
 * cancelled and finished, and it detaches itself, so Wait then gives 3 (or
 * -1 once the object has let go of the thread).
 *
 * Thread safety: Wait, Detach, Cancel, Kill and Exists may be called from
 * any thread while the thread runs; they serialise on m_mutex. A Cancel or
 * Kill must not race the return of a Wait that joins (the identifier may be
 * stale by then); issue them from the thread that waits, or order them.
 *
 * Typical use:
 * @code
 *   MThread thread(MThread_::PriorityNormal);
 *   thread.Create(routine, arg, 0, 0, 0, nullptr);
 *   if (thread.Wait(nullptr, nullptr, 5000) == -5) { thread.Cancel(); }
 *   thread.Wait(nullptr, nullptr, -1);
 * @endcode
 */
class TESSALINE_API MThread : public MThread_ {
public:
    /// The calling thread's pthread_self().
    static unsigned long ThreadID();
    /// Lets other threads run (sched_yield).
    static void YieldThread();
    /// Ends the calling thread with `value`. A thread started by Create goes
    /// through CancelThread, so it counts as cancelled.
    [[noreturn]] static void Exit(void* value);
    /// pthread_once on `control` (an int set to 0 beforehand). Returns 0, or
    /// -1 with a line on stderr; a null `control` gives -1 (EINVAL).
    static int Once(void (*routine)(), int* control);
    /// Runs the object's routine with the wrapping that Create gives it (the
    /// signal mask, deferred cancellation, m_finished, CancelThread) on the
    /// calling thread. Create's threads run the same steps.
    static void* ThreadRoutineWrapper(MThread* thread);
    /// The clean-up step of a thread that is cancelled or calls Exit: marks
    /// the MThread given cancelled and finished and detaches its thread.
    static void CancelThread(void* thread);

    /// An object without a thread, with a mutex and a condition of its own.
    /// `priority` is only stored.
    explicit MThread(MThread_::ThreadPriority priority = PriorityNormal);
    /// Copies every value, m_lastError included, but has a mutex and a
    /// condition of its own. The copy doesn't control the thread's wake-ups:
    /// its timed Wait only sees a thread that had finished when it was made.
    /// Once one object has joined the thread, the others' m_thread is stale:
    /// set it to 0 before using or destroying them.
    MThread(const MThread& other);
    /// Copies m_routine, m_arg, m_cancelled, m_thread, m_attr and m_finished;
    /// m_state, m_priority and m_lastError stay.
    virtual MThread& operator=(const MThread& other);

    /// Detaches a created thread that nobody joined (unless a Wait is joining
    /// it) and lets go of the mutex and the condition, which a thread still
    /// running keeps until its routine has ended. A thread adopted through
    /// Self is left alone.
    ~MThread() override;

    /// Starts `routine(arg)` in a new thread through ThreadRoutineWrapper.
    /// stackSize 0 is the platform's default; a size the platform refuses
    /// leaves the default too. detached 1 starts it detached and the object
    /// lets go of it at once (m_state 3, m_thread 0): Wait, Exists, Cancel and
    /// Kill then have no thread to act on, while m_finished and m_cancelled
    /// are still kept. Returns 0, or -1 with the platform code in m_lastError
    /// (a line on stderr unless it is EAGAIN); a failure leaves m_state as it
    /// was. On an object that has already started a thread (m_state not 0):
    /// -1 with EBUSY, nothing started. A null routine starts a thread that
    /// ends at once with (void*)-1 and marks the object finished. The last
    /// two arguments have no effect.
    int Create(void* (*routine)(void*), void* arg, int stackSize, int detached, int, int*) override;

    /// The object stands for the calling thread from now on: its identifier
    /// goes into m_thread and comes back.
    unsigned long Self() override;

    /// Not available on this platform: -4, nothing done.
    ///@{
    int Suspend() override;
    int Resume() override;
    ///@}

    /// Detaches the thread unless it is detached already or there is none.
    /// Returns the status of m_lastError, which a call with nothing to do
    /// leaves as it was. While another thread joins it: -1 with EINVAL.
    int Detach() override;

    /// Asks the thread to stop and marks the object cancelled. The result is
    /// only visible in LastError: ESRCH when the object has no thread to act
    /// on (m_cancelled is still set, for a routine that polls Cancelled).
    void Cancel() override;

    /// Cancels like Cancel. The caller's own cancellation type and state are
    /// left exactly as they were: an asynchronously cancellable host thread
    /// could be cancelled inside malloc or while it holds a lock. The
    /// target's cancellation is its own (deferred in a created thread). It
    /// never sends SIGKILL: on Linux that signal ends the whole process, not
    /// one thread. Returns the status of the cancel request; `err`, if given,
    /// receives its code. Without a thread: -1 with ESRCH, silently.
    /// m_cancelled is not set here but by the thread as it goes out through
    /// CancelThread.
    int Kill(int* err) override;

    /// Waits for the thread and joins it. timeout in milliseconds, of the
    /// grain of MCondVar::Wait; 0 waits as long as it takes; -1 joins
    /// straight away; any other negative value is an immediate timeout.
    /// Returns 0 once joined, with the routine's result in *retval if retval
    /// is not null (PTHREAD_CANCELED for a thread ended by cancellation while
    /// it was being joined); -5 when the time ran out (ETIMEDOUT in
    /// m_lastError; the thread runs on and Wait can be called again); 3 if
    /// the thread is detached; -1 if there is no thread to wait for or a
    /// platform call failed (EINVAL, with a line, if another Wait is joining
    /// the thread at the same time). Each pass of the wait starts the full
    /// timeout again, so a spurious wake-up extends it. `err` has no effect.
    int Wait(int** retval, int* err, long timeout) override;

    /// For the routine, on its own object. A cancellation point. Returns
    /// m_cancelled at once if it is set or milliseconds is 0; otherwise
    /// sleeps up to `milliseconds` in slices of at most about six seconds,
    /// ending early once the object is cancelled, and returns m_cancelled.
    /// The end is measured on the 32-bit microsecond tick counter: a pause
    /// that would end past its wrap, and a negative one, end at once. `err`
    /// has no effect.
    int Cancelled(int* err, int milliseconds) override;

    /// Does nothing at all, not even store the value.
    void Priority(MThread_::ThreadPriority priority) override;
    /// The priority given to the constructor.
    MThread_::ThreadPriority Priority() override;

    /// True if the object has a thread and the platform still knows it. A
    /// thread that has ended but was not joined may still count as existing.
    bool Exists() override;

    /// Cancelled(err, milliseconds): -6 if the thread was cancelled, else 0.
    /// With cancellation disabled in the thread, a Cancel ends the pause after
    /// the current slice.
    virtual int Pause(int* err, int milliseconds);

    /// m_thread.
    operator unsigned long() const;

    /// Signalled when the routine ends. Shared with the thread, which keeps
    /// it past the object's end; never delete it.
    MCondVar* m_cond;
    /// MutexPlain; guards m_finished and the wait. Shared like m_cond.
    MMutex* m_mutex;
    void* (*m_routine)(void*);  ///< The routine given to Create; null before.
    void* m_arg;                ///< Its argument.
    /// 1 once the routine has ended in any way.
    int m_finished;
    /// 1 once Cancel was called or the thread went out through CancelThread.
    int m_cancelled;
    /// The attributes the thread was created with.
    pthread_attr_t m_attr;
    /// The platform identifier; 0 when the object has no thread to join or
    /// signal.
    unsigned long m_thread;

    /// Made when the library loads, with a count of 64; nothing here waits on
    /// it or signals it.
    static MSemaphore m_thrdSemaphore;

private:
    // What the object shares with its thread, m_mutex and m_cond included;
    // it lives until both are done with it.
    tessaline::thread::ThreadControl* m_control;
};

#endif
