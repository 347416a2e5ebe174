#include <cerrno>
#include <csignal>
#include <string>
#include <thread>

#include <gtest/gtest.h>

#include "support/capture_stderr.h"
#include "support/scoped_sys_calls.h"
#include "tessaline/tessaline.h"
#include "thread/sys.h"
#include "thread/thread_test_support.h"

using tessaline::test::CaptureStderr;
using tessaline::test::OnOtherThread;
using tessaline::testing::ScopedSysCalls;
using tessaline::thread::Sys;

namespace {

int g_answer = 42;

// A routine that waits until the test opens the gate, then returns &g_answer.
struct Gate {
    MSemaphore open{0, 0};
    Gate() { open.Init(0); }
};

void* WaitAtGate(void* gate)
{
    static_cast<Gate*>(gate)->open.Wait();
    return &g_answer;
}

// A thread that pauses, five seconds if cancellable, else one; pauseStatus
// stays 99 unless Pause returns.
struct Pauser {
    explicit Pauser(bool cancellable) : cancellable(cancellable) { started.Init(0); }
    MThread thread;
    MSemaphore started{0, 0};
    bool cancellable;
    int pauseStatus = 99;
};

void* PauseLong(void* arg)
{
    auto& pauser = *static_cast<Pauser*>(arg);
    if (!pauser.cancellable) {
        pthread_setcancelstate(PTHREAD_CANCEL_DISABLE, nullptr);
    }
    pauser.started.Signal();
    pauser.pauseStatus = pauser.thread.Pause(nullptr, pauser.cancellable ? 5000 : 1000);
    return nullptr;
}

int Load(const int& field)
{
    return __atomic_load_n(&field, __ATOMIC_RELAXED);
}

// For a thread that detached itself: once m_finished is seen under the
// mutex, the thread is done with the object.
void WaitUntilFinished(MThread& thread)
{
    thread.m_mutex->Lock(nullptr);
    while (Load(thread.m_finished) == 0) {
        thread.m_cond->Wait(*thread.m_mutex, nullptr, 0);
    }
    thread.m_mutex->Unlock(nullptr);
}

}  // namespace

// The object may go while its thread runs; the thread, ending by return or
// by Exit, must not touch what the object freed (AddressSanitizer tells).
// A thread-specific value's destructor reports the end: it runs once the
// start routine has returned.
TEST(MThread, DeletingTheObjectOfARunningThreadIsSafe)
{
    struct Ending {
        Gate gate;
        MSemaphore gone{0, 0};
        bool byExit;
    };
    static pthread_key_t key;
    // A bare post: the waiter may reuse the memory as soon as it wakes.
    ASSERT_EQ(0, pthread_key_create(
                     &key, [](void* ending) { MSemaphore::Cleanup(&static_cast<Ending*>(ending)->gone.m_sem); }));
    for (bool byExit : {false, true}) {
        Ending ending;
        ending.gone.Init(0);
        ending.byExit = byExit;
        auto* thread = new MThread;
        ASSERT_EQ(0, thread->Create(
                         [](void* arg) -> void* {
                             auto& self = *static_cast<Ending*>(arg);
                             pthread_setspecific(key, &self);
                             WaitAtGate(&self.gate);
                             if (self.byExit) {
                                 MThread::Exit(nullptr);
                             }
                             return nullptr;
                         },
                         &ending, 0, 0, 0, nullptr));
        delete thread;
        ending.gate.open.Signal();
        EXPECT_EQ(0, ending.gone.Wait());
    }
    pthread_key_delete(key);
}

TEST(MThread, TimedWaitRunsOutThenWaitJoinsAndDeliversTheResult)
{
    Gate gate;
    MThread thread(MThread_::PriorityHigh);
    ASSERT_EQ(0, thread.Create(WaitAtGate, &gate, 64 * 1024, 0, 0, nullptr));
    EXPECT_EQ(1, thread.m_state);
    EXPECT_TRUE(thread.Exists());
    {
        // One object starts one thread.
        CaptureStderr capture;
        EXPECT_EQ(-1, thread.Create(WaitAtGate, &gate, 0, 0, 0, nullptr));
        EXPECT_EQ(EBUSY, thread.LastError());
        EXPECT_NE(std::string::npos, capture.Text().find("(16)\n"));
    }
    int* result = nullptr;
    EXPECT_EQ(-5, thread.Wait(&result, nullptr, 1));
    EXPECT_EQ(ETIMEDOUT, thread.LastError());
    EXPECT_EQ(nullptr, result);

    std::thread opener([&] { gate.open.Signal(); });
    EXPECT_EQ(0, thread.Wait(&result, nullptr, 0));
    opener.join();
    EXPECT_EQ(&g_answer, result);
    EXPECT_EQ(0UL, static_cast<unsigned long>(thread));
    EXPECT_FALSE(thread.Exists());
    EXPECT_EQ(-1, thread.Wait(&result, nullptr, -1));

    // Without a routine the thread ends at once with -1 as its result.
    MThread empty;
    ASSERT_EQ(0, empty.Create(nullptr, nullptr, 0, 0, 0, nullptr));
    EXPECT_EQ(0, empty.Wait(&result, nullptr, 0));
    EXPECT_EQ(reinterpret_cast<int*>(-1), result);
}

TEST(MThread, ObjectWithoutAThread)
{
    MThread thread(MThread_::PriorityLow);
    EXPECT_EQ(-1, thread.Wait(nullptr, nullptr, 0));
    EXPECT_EQ(-1, thread.Wait(nullptr, nullptr, -1));
    EXPECT_FALSE(thread.Exists());
    EXPECT_EQ(-4, thread.Suspend());
    EXPECT_EQ(-4, thread.Resume());
    EXPECT_EQ(0, thread.Pause(nullptr, 0));

    CaptureStderr capture;
    thread.Cancel();
    EXPECT_EQ(ESRCH, thread.LastError());
    EXPECT_EQ(1, thread.m_cancelled);
    EXPECT_EQ(-6, thread.Pause(nullptr, 0));
    {
        // A failed start leaves the object as it was, and EAGAIN is silent.
        ScopedSysCalls restore(Sys());
        Sys().pthread_create = [](pthread_t*, const pthread_attr_t*, void* (*)(void*), void*) { return EAGAIN; };
        EXPECT_EQ(-1, thread.Create(WaitAtGate, nullptr, 0, 0, 0, nullptr));
        EXPECT_EQ(EAGAIN, thread.LastError());
        EXPECT_EQ(0, thread.m_state);
    }
    // Kill changes the caller's cancellation type: keep that off this thread.
    int err = 0;
    EXPECT_EQ(-1, OnOtherThread([&] { return thread.Kill(&err); }));
    EXPECT_EQ(ESRCH, err);
    EXPECT_EQ("", capture.Text());
}

// Detached at Create, by Detach, or by going out through Exit, which counts
// as cancelled: the object lets go of the thread at once.
TEST(MThread, DetachedThreadIsGivenUpAtOnce)
{
    for (int how : {0, 1, 2}) {
        Gate gate;
        MThread thread;
        ASSERT_EQ(0, thread.Create(how == 2 ? [](void*) -> void* { MThread::Exit(nullptr); } : WaitAtGate, &gate, 0,
                                   how == 0, 0, nullptr));
        if (how == 1) {
            // The status is Detach's own, not an older error's.
            thread.StoreLastError(EPERM);
            EXPECT_EQ(0, thread.Detach());
            EXPECT_EQ(0, thread.LastError());
        }
        if (how == 2) {
            const int status = thread.Wait(nullptr, nullptr, 0);
            EXPECT_TRUE(status == 3 || status == -1) << status;
        }
        EXPECT_EQ(3, thread.m_state);
        EXPECT_EQ(0UL, static_cast<unsigned long>(thread));
        EXPECT_FALSE(thread.Exists());
        EXPECT_EQ(-1, thread.Wait(nullptr, nullptr, 0));
        gate.open.Signal();
        WaitUntilFinished(thread);
        EXPECT_EQ(how == 2 ? 1 : 0, Load(thread.m_cancelled)) << how;
    }
}

// Kill is Cancel that also leaves the caller's own cancellation as it found
// it and never signals the process. Either ends the thread at a cancellation
// point in its pause (Wait: 3 if it found the thread still there, -1 if it
// had gone), or, when the request comes after the pause's last cancellation
// point, the routine sees the flag and returns (Wait: 0).
TEST(MThread, CancelOrKillDuringPauseEndsTheThreadOrThePause)
{
    for (bool kill : {false, true}) {
        Pauser pauser(true);
        ASSERT_EQ(0, pauser.thread.Create(PauseLong, &pauser, 0, 0, 0, nullptr));
        ASSERT_EQ(0, pauser.started.Wait());
        if (kill) {
            int err = -1;
            EXPECT_EQ(0, OnOtherThread([&] {
                          pthread_setcancelstate(PTHREAD_CANCEL_DISABLE, nullptr);
                          const int status = pauser.thread.Kill(&err);
                          int state = -1;
                          int type = -1;
                          pthread_setcancelstate(PTHREAD_CANCEL_DISABLE, &state);
                          pthread_setcanceltype(PTHREAD_CANCEL_DEFERRED, &type);
                          EXPECT_EQ(PTHREAD_CANCEL_DISABLE, state);
                          EXPECT_EQ(PTHREAD_CANCEL_DEFERRED, type);
                          return status;
                      }));
            EXPECT_EQ(0, err);
        } else {
            pauser.thread.Cancel();
            EXPECT_EQ(0, pauser.thread.LastError());
        }
        const int status = pauser.thread.Wait(nullptr, nullptr, 0);
        if (status == 0) {
            EXPECT_EQ(-6, pauser.pauseStatus);
            EXPECT_EQ(1, pauser.thread.m_state);
        } else {
            EXPECT_TRUE(status == 3 || status == -1) << status;
            WaitUntilFinished(pauser.thread);
            EXPECT_EQ(99, pauser.pauseStatus);
            EXPECT_EQ(3, pauser.thread.m_state);
        }
        EXPECT_EQ(1, Load(pauser.thread.m_cancelled));
        EXPECT_EQ(0UL, static_cast<unsigned long>(pauser.thread));
        EXPECT_FALSE(pauser.thread.Exists());
    }
}

TEST(MThread, PauseWithCancellationDisabledEndsAfterItsSlice)
{
    Pauser pauser(false);
    ASSERT_EQ(0, pauser.thread.Create(PauseLong, &pauser, 0, 0, 0, nullptr));
    ASSERT_EQ(0, pauser.started.Wait());
    pauser.thread.Cancel();
    EXPECT_EQ(0, pauser.thread.Wait(nullptr, nullptr, -1));
    EXPECT_EQ(-6, pauser.pauseStatus);
    EXPECT_EQ(1, pauser.thread.m_state);
}

TEST(MThread, CreatedThreadBlocksEverySignalButKill)
{
    MThread thread;
    sigset_t mask;
    sigemptyset(&mask);
    ASSERT_EQ(0, thread.Create(
                     [](void* arg) -> void* {
                         pthread_sigmask(SIG_BLOCK, nullptr, static_cast<sigset_t*>(arg));
                         return nullptr;
                     },
                     &mask, 0, 0, 0, nullptr));
    ASSERT_EQ(0, thread.Wait(nullptr, nullptr, -1));
    for (int signal : {SIGHUP, SIGINT, SIGQUIT, SIGUSR1, SIGUSR2, SIGPIPE, SIGALRM, SIGTERM, SIGCHLD}) {
        EXPECT_EQ(1, sigismember(&mask, signal)) << signal;
    }
    EXPECT_EQ(0, sigismember(&mask, SIGKILL));
}

TEST(MThread, CountsObjectsThroughCopiesAndAssignsOnlyTheThreadFields)
{
    const int before = __atomic_load_n(&MThread_::m_threadCnt, __ATOMIC_RELAXED);
    {
        Gate gate;
        MThread first(MThread_::PriorityHigh);
        MThread second(MThread_::PriorityLow);
        ASSERT_EQ(0, first.Create(WaitAtGate, &gate, 0, 0, 0, nullptr));
        MThread copy(first);
        EXPECT_EQ(before + 3, __atomic_load_n(&MThread_::m_threadCnt, __ATOMIC_RELAXED));
        EXPECT_EQ(1, copy.m_state);
        EXPECT_EQ(MThread_::PriorityHigh, copy.Priority());

        second = first;
        EXPECT_EQ(static_cast<unsigned long>(first), static_cast<unsigned long>(second));
        EXPECT_EQ(&WaitAtGate, second.m_routine);
        EXPECT_EQ(0, second.m_state);
        EXPECT_EQ(MThread_::PriorityLow, second.Priority());

        gate.open.Signal();
        EXPECT_EQ(0, copy.Wait(nullptr, nullptr, -1));
        // first still names the thread that copy joined; its destructor would
        // detach that stale identifier.
        first.m_thread = 0;
    }
    EXPECT_EQ(before, __atomic_load_n(&MThread_::m_threadCnt, __ATOMIC_RELAXED));
}

TEST(MThread, SelfAdoptsTheCallingThreadWithoutDetachingIt)
{
    std::thread host([] {
        MThread thread;
        EXPECT_EQ(static_cast<unsigned long>(pthread_self()), thread.Self());
        EXPECT_EQ(MThread::ThreadID(), static_cast<unsigned long>(thread));
        EXPECT_TRUE(thread.Exists());
    });
    // Still joinable: the adopting object let it be.
    host.join();
}

TEST(MThread, OnceRunsItsRoutineOnce)
{
    static int calls = 0;
    int control = 0;
    EXPECT_EQ(0, MThread::Once([] { ++calls; }, &control));
    EXPECT_EQ(0, MThread::Once([] { ++calls; }, &control));
    EXPECT_EQ(1, calls);
    CaptureStderr capture;
    EXPECT_EQ(-1, MThread::Once([] {}, nullptr));
}
