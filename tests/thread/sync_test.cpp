#include <cerrno>
#include <ctime>
#include <string>

#include <gtest/gtest.h>

#include "support/capture_stderr.h"
#include "support/scoped_sys_calls.h"
#include "tessaline/tessaline.h"
#include "thread/sys.h"
#include "thread/thread_test_support.h"

using tessaline::test::CaptureStderr;
using tessaline::test::Line;
using tessaline::test::OnOtherThread;
using tessaline::testing::ScopedSysCalls;
using tessaline::thread::Sys;

namespace {

// Whether another thread finds the platform mutex free.
bool FreeElsewhere(MMutex& mutex)
{
    return OnOtherThread(
        [&] { return pthread_mutex_trylock(&mutex.m_mutex) == 0 && !pthread_mutex_unlock(&mutex.m_mutex); });
}

// A condition wait during which another thread takes and releases the mutex
// that the waiter holds.
MMutex* g_passedThrough = nullptr;

int PassThrough(pthread_mutex_t* platform, int result)
{
    pthread_mutex_unlock(platform);
    const bool passed =
        OnOtherThread([] { return !g_passedThrough->Lock(nullptr) && !g_passedThrough->Unlock(nullptr); });
    pthread_mutex_lock(platform);
    return passed ? result : EINVAL;
}

}  // namespace

TEST(CheckSyserror, RoutineCodesAreSilentOthersWriteOneLine)
{
    CaptureStderr capture;
    EXPECT_EQ(0, CHECK_SYSERROR(0));
    for (int code : {ENOENT, ESRCH, EAGAIN, EBUSY, -2}) {
        EXPECT_EQ(-1, CHECK_SYSERROR(code));
    }
    EXPECT_EQ(Line(EBUSY) + Line(-2), capture.Text());
}

TEST(MMutex, RecursiveHolderNeedsAsManyUnlocksAsLocks)
{
    MMutex mutex(MMutex_::MutexRecursive);
    ASSERT_EQ(0, mutex.Lock(nullptr));
    // Re-entry leaves an older error alone; Try clears it.
    mutex.StoreLastError(99);
    ASSERT_EQ(0, mutex.Lock(nullptr));
    EXPECT_EQ(99, mutex.LastError());
    ASSERT_EQ(0, mutex.Try(nullptr));
    EXPECT_EQ(0, mutex.LastError());
    EXPECT_EQ(3, mutex.m_count);
    EXPECT_EQ(1, mutex.Locked());
    EXPECT_EQ(0, mutex.Unlock(nullptr));
    EXPECT_EQ(0, mutex.Unlock(nullptr));
    // Another thread's Try fails at once and reports EBUSY.
    EXPECT_TRUE(OnOtherThread([&] {
        CaptureStderr capture;
        return mutex.Try(nullptr) == -1 && capture.Text() == Line(EBUSY);
    }));
    EXPECT_EQ(EBUSY, mutex.LastError());
    EXPECT_EQ(0, mutex.Unlock(nullptr));
    EXPECT_EQ(0, mutex.Locked());
    EXPECT_TRUE(FreeElsewhere(mutex));
}

// A plain mutex is the platform's, with or without an err to fill.
TEST(MMutex, PlainLockIsHeldUntilUnlock)
{
    MMutex mutex(MMutex_::MutexPlain);
    int err = -1;
    for (int* e : {static_cast<int*>(nullptr), &err}) {
        ASSERT_EQ(0, mutex.Lock(e));
        EXPECT_FALSE(FreeElsewhere(mutex));
        EXPECT_EQ(0, mutex.Unlock(e));
        EXPECT_TRUE(FreeElsewhere(mutex));
    }
}

// Unlock of a tracked mutex that nobody holds gives 3; by a thread that is
// not the holder, -2, and the holder keeps it. A checked mutex refuses its
// holder's second Lock and everyone else with 2 instead of queueing them.
// None of the refusals writes a line.
TEST(MMutex, TrackedTypesRefuseSilently)
{
    for (auto type : {MMutex_::MutexChecked, MMutex_::MutexRecursive}) {
        MMutex mutex(type);
        CaptureStderr capture;
        EXPECT_EQ(3, mutex.Unlock(nullptr));
        EXPECT_EQ(-2, mutex.LastError());
        ASSERT_EQ(0, mutex.Try(nullptr));
        EXPECT_EQ(-2, OnOtherThread([&] { return mutex.Unlock(nullptr); }));
        EXPECT_EQ(-2, mutex.LastError());
        EXPECT_EQ(static_cast<unsigned long>(pthread_self()), mutex.m_owner);
        if (type == MMutex_::MutexChecked) {
            mutex.StoreLastError(0);
            EXPECT_EQ(2, mutex.Lock(nullptr));
            EXPECT_EQ(-2, mutex.LastError());
            EXPECT_EQ(2, OnOtherThread([&] { return mutex.Lock(nullptr); }));
            EXPECT_EQ(2, OnOtherThread([&] { return mutex.Try(nullptr); }));
            EXPECT_EQ(1, mutex.m_count);
        }
        EXPECT_EQ(0, mutex.Unlock(nullptr));
        EXPECT_EQ("", capture.Text());
    }
}

// A failed platform call reaches the caller as -1 with its code, and the
// record of a tracked mutex stays free. A type outside the enumeration
// takes nothing.
TEST(MMutex, PlatformFailuresAndUnknownTypesTakeNothing)
{
    MMutex odd(static_cast<MMutex_::MutexType>(7));
    EXPECT_EQ(0, odd.Try(nullptr));
    EXPECT_EQ(0, odd.Lock(nullptr));
    EXPECT_TRUE(FreeElsewhere(odd));

    ScopedSysCalls restore(Sys());
    Sys().pthread_mutex_lock = [](pthread_mutex_t*) { return EDEADLK; };
    Sys().pthread_mutex_trylock = [](pthread_mutex_t*) { return EINVAL; };
    for (auto type : {MMutex_::MutexPlain, MMutex_::MutexChecked, MMutex_::MutexRecursive}) {
        MMutex mutex(type);
        CaptureStderr capture;
        EXPECT_EQ(-1, mutex.Lock(nullptr));
        EXPECT_EQ(EDEADLK, mutex.LastError());
        EXPECT_EQ(-1, mutex.Try(nullptr));
        EXPECT_EQ(EINVAL, mutex.LastError());
        EXPECT_EQ(0, mutex.m_held);
        EXPECT_EQ(0, mutex.Locked());
        EXPECT_EQ(Line(EDEADLK) + Line(EINVAL), capture.Text()) << type;
    }
}

// A timed-out waiter holds the mutex again, still as its recorded holder.
TEST(MCondVar, TimeoutsHaveAWholeSecondGrainFromTheCurrentSecond)
{
    static timespec deadline;
    ScopedSysCalls restore(Sys());
    Sys().pthread_cond_timedwait = [](pthread_cond_t*, pthread_mutex_t*, const timespec* until) {
        deadline = *until;
        return ETIMEDOUT;
    };
    // Milliseconds, and the seconds added to the current one; -1: no wait at all.
    const long cases[][2] = {{1, 1}, {1999, 1}, {2000, 2}, {2500, 2}, {60000, 60}, {-1, -1}};
    MMutex mutex(MMutex_::MutexChecked);
    MCondVar cond;
    CaptureStderr capture;
    for (const auto& c : cases) {
        deadline = {-1, -1};
        ASSERT_EQ(0, mutex.Lock(nullptr));
        const time_t before = std::time(nullptr);
        EXPECT_EQ(-5, cond.Wait(mutex, nullptr, c[0])) << c[0];
        EXPECT_EQ(ETIMEDOUT, cond.LastError());
        EXPECT_LE(c[1] < 0 ? -1 : before + c[1], deadline.tv_sec) << c[0];
        EXPECT_GE(c[1] < 0 ? -1 : std::time(nullptr) + c[1], deadline.tv_sec) << c[0];
        EXPECT_EQ(c[1] < 0 ? -1 : 0, deadline.tv_nsec);
        EXPECT_EQ(0, mutex.Unlock(nullptr));
    }
    EXPECT_EQ("", capture.Text());
}

// Another thread passes through the mutex while the waiter waits: the wait
// releases it fully, count 2 notwithstanding. Woken or timed out, the waiter
// gets it back with its own record.
TEST(MCondVar, WaiterGetsRecursiveMutexBackWithItsRecord)
{
    ScopedSysCalls restore(Sys());
    Sys().pthread_cond_wait = [](pthread_cond_t*, pthread_mutex_t* mutex) { return PassThrough(mutex, 0); };
    Sys().pthread_cond_timedwait = [](pthread_cond_t*, pthread_mutex_t* mutex, const timespec*) {
        return PassThrough(mutex, ETIMEDOUT);
    };
    for (long timeout : {0L, 1L}) {
        MMutex mutex(MMutex_::MutexRecursive);
        MCondVar cond;
        g_passedThrough = &mutex;
        ASSERT_EQ(0, mutex.Lock(nullptr));
        ASSERT_EQ(0, mutex.Lock(nullptr));
        EXPECT_EQ(timeout == 0 ? 0 : -5, cond.Wait(mutex, nullptr, timeout));
        EXPECT_EQ(static_cast<unsigned long>(pthread_self()), mutex.m_owner);
        EXPECT_EQ(2, mutex.m_count);
        EXPECT_EQ(1, mutex.Locked());
        EXPECT_EQ(0, mutex.Unlock(nullptr));
        EXPECT_EQ(0, mutex.Unlock(nullptr));
        EXPECT_EQ(3, mutex.Unlock(nullptr));
    }
}

// A waiter that ends inside the wait, as a cancelled one does, holds the
// platform mutex again; on its way out it must leave the checked mutex free.
TEST(MCondVar, WaiterEndingInTheWaitLeavesCheckedMutexFree)
{
    static MMutex mutex(MMutex_::MutexChecked);
    ScopedSysCalls restore(Sys());
    Sys().pthread_cond_wait = [](pthread_cond_t*, pthread_mutex_t*) -> int { pthread_exit(nullptr); };
    pthread_t waiter;
    ASSERT_EQ(0, pthread_create(
                     &waiter, nullptr,
                     [](void*) -> void* {
                         MCondVar cond;
                         mutex.Lock(nullptr);
                         cond.Wait(mutex, nullptr, 0);
                         return &mutex;
                     },
                     nullptr));
    void* result = &mutex;
    ASSERT_EQ(0, pthread_join(waiter, &result));
    EXPECT_EQ(nullptr, result);
    EXPECT_EQ(0, mutex.Lock(nullptr));
    EXPECT_EQ(0, mutex.Unlock(nullptr));
}

TEST(MCondVar, RefusesAMutexThatIsNoMMutex)
{
    struct OtherMutex : MMutex_ {
        int Create(MutexType, int*) override { return 0; }
        int Try(int*) override { return 0; }
        int Lock(int*) override { return 0; }
        int Unlock(int*) override { return 0; }
    } other;
    MCondVar cond;
    CaptureStderr capture;
    EXPECT_EQ(-1, cond.Wait(other, nullptr, 0));
    EXPECT_EQ(EINVAL, cond.LastError());
    EXPECT_EQ(Line(EINVAL), capture.Text());
}

// A count of 0 or less makes no platform object: until Init every call
// refuses with EINVAL. Counts stop at 32767; an empty semaphore refuses Try
// silently.
TEST(MSemaphore, CountsFromInitUpTo32767)
{
    // The thread objects' semaphore is made when the library loads.
    EXPECT_EQ(64, MThread::m_thrdSemaphore.Count());

    MSemaphore semaphore(0, 0);
    CaptureStderr capture;
    EXPECT_EQ(-1, semaphore.Count());
    EXPECT_EQ(-1, semaphore.Try());
    EXPECT_EQ(-1, semaphore.Signal());
    EXPECT_EQ(EINVAL, semaphore.LastError());
    EXPECT_EQ(-1, semaphore.Init(-1));
    EXPECT_EQ(-1, semaphore.Count());
    EXPECT_EQ(Line(EINVAL) + Line(EINVAL) + Line(EINVAL), capture.Text());

    EXPECT_EQ(0, semaphore.Init(3));
    EXPECT_EQ(0, semaphore.Wait());
    EXPECT_EQ(0, semaphore.Try());
    EXPECT_EQ(1, semaphore.Count());
    EXPECT_EQ(0, semaphore.Signal());
    MSemaphore::Cleanup(&semaphore.m_sem);
    EXPECT_EQ(3, semaphore.Count());
    EXPECT_EQ(0, semaphore.Init(32768));
    EXPECT_EQ(32767, semaphore.Count());
    EXPECT_EQ(32767, MSemaphore(100000, 0).Count());

    EXPECT_EQ(0, semaphore.Init(0));
    CaptureStderr quiet;
    EXPECT_EQ(-1, semaphore.Try());
    EXPECT_EQ(EAGAIN, semaphore.LastError());
    EXPECT_EQ("", quiet.Text());
}

// The semaphore calls report through errno; a wait that a signal handler
// interrupts goes on waiting.
TEST(MSemaphore, PlatformFailuresBecomeTheStatusAndTheLastError)
{
    static int interruptions;
    MSemaphore semaphore(1, 0);
    ScopedSysCalls restore(Sys());
    Sys().sem_wait = [](sem_t*) { return errno = --interruptions >= 0 ? EINTR : EINVAL, -1; };
    Sys().sem_post = [](sem_t*) { return errno = EOVERFLOW, -1; };
    Sys().sem_init = [](sem_t*, int, unsigned int) { return errno = ENOSYS, -1; };
    CaptureStderr capture;
    interruptions = 2;
    EXPECT_EQ(-1, semaphore.Wait());
    EXPECT_EQ(-1, interruptions);
    EXPECT_EQ(EINVAL, semaphore.LastError());
    EXPECT_EQ(-1, semaphore.Signal());
    EXPECT_EQ(EOVERFLOW, semaphore.LastError());
    EXPECT_EQ(-1, semaphore.Init(5));
    EXPECT_EQ(ENOSYS, semaphore.LastError());
    EXPECT_EQ(-1, semaphore.Count());
    EXPECT_EQ(Line(EINVAL) + Line(EOVERFLOW) + Line(ENOSYS), capture.Text());
}

TEST(MThreadKey, EachThreadSeesItsOwnValueAndItsDestructorGetsIt)
{
    static void* exitValue = nullptr;
    unsigned int number = 0;
    {
        MThreadKey key;
        ASSERT_EQ(0, key.Create(reinterpret_cast<void (*)()>(+[](void* value) { exitValue = value; }), 0, nullptr));
        number = key;
        int mine = 1;
        int theirs = 2;
        EXPECT_EQ(nullptr, key.GetValue(nullptr));
        EXPECT_EQ(0, key.SetValue(&mine, nullptr));
        EXPECT_EQ(nullptr, OnOtherThread([&] { return key.GetValue(nullptr); }));
        EXPECT_EQ(&theirs, OnOtherThread([&] {
            key.SetValue(&theirs, nullptr);
            return key.GetValue(nullptr);
        }));
        EXPECT_EQ(&theirs, exitValue);
        EXPECT_EQ(&mine, key.GetValue(nullptr));
    }
    // The object deleted its key, whatever its number (0 included): the
    // platform hands out the lowest free key, ours again.
    pthread_key_t next;
    ASSERT_EQ(0, pthread_key_create(&next, nullptr));
    EXPECT_EQ(number, next);
    pthread_key_delete(next);

    MThreadKey empty;
    int value = 1;
    CaptureStderr capture;
    EXPECT_EQ(-1, empty.SetValue(&value, nullptr));
    EXPECT_EQ(EINVAL, empty.LastError());
    EXPECT_EQ(nullptr, empty.GetValue(nullptr));
}
