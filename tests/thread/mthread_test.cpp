#include <array>
#include <cerrno>
#include <chrono>
#include <csignal>
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

int g_answer = 42;

// What a Detach, the last error and a Wait gave while another Wait joined.
using Refusals = std::array<int, 3>;
MThread* g_joined = nullptr;
Refusals g_refusals;

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

// Opened by the first condition wait of a Wait: the thread then ends while
// Wait is known to be waiting for it.
Gate* g_openOnWait = nullptr;

int OpenGateAndWait(pthread_cond_t* cond, pthread_mutex_t* mutex)
{
    g_openOnWait->open.Signal();
    return pthread_cond_wait(cond, mutex);
}

// For a thread that detached itself: once m_finished is seen under the
// mutex, the thread is done with the object and with the seam table.
void WaitUntilFinished(MThread& thread)
{
    thread.m_mutex->Lock(nullptr);
    while (__atomic_load_n(&thread.m_finished, __ATOMIC_RELAXED) == 0) {
        thread.m_cond->Wait(*thread.m_mutex, nullptr, 0);
    }
    thread.m_mutex->Unlock(nullptr);
}

}  // namespace

// The object may go while its thread runs; the thread, ending by return or
// by Exit, must not touch what the object freed (AddressSanitizer tells).
TEST(MThread, DeletingTheObjectOfARunningThreadIsSafe)
{
    // The destructor detaches the thread; the detach is only recorded, so the
    // test can join the thread to know that it has ended.
    static pthread_t detached;
    ScopedSysCalls restore(Sys());
    Sys().pthread_detach = [](pthread_t thread) { return detached = thread, 0; };
    for (bool byExit : {false, true}) {
        Gate gate;
        auto* thread = new MThread;
        ASSERT_EQ(0, thread->Create(byExit ? [](void* gate) -> void* { MThread::Exit(WaitAtGate(gate)); } : WaitAtGate,
                                    &gate, 0, 0, 0, nullptr));
        const pthread_t id = static_cast<unsigned long>(*thread);
        detached = 0;
        delete thread;
        EXPECT_EQ(id, detached);
        gate.open.Signal();
        EXPECT_EQ(0, pthread_join(id, nullptr));
    }
}

TEST(MThread, TimedWaitRunsOutThenWaitJoinsAndDeliversTheResult)
{
    // Without a routine the thread ends at once with -1 as its result.
    int* result = nullptr;
    MThread empty;
    ASSERT_EQ(0, empty.Create(nullptr, nullptr, 0, 0, 0, nullptr));
    EXPECT_EQ(0, empty.Wait(&result, nullptr, 0));
    EXPECT_EQ(reinterpret_cast<int*>(-1), result);

    Gate gate;
    MThread thread(MThread_::PriorityHigh);
    ASSERT_EQ(0, thread.Create(WaitAtGate, &gate, 64 * 1024, 0, 0, nullptr));
    EXPECT_EQ(1, thread.m_state);
    EXPECT_TRUE(thread.Exists());
    CaptureStderr capture;
    // One object starts one thread.
    EXPECT_EQ(-1, thread.Create(WaitAtGate, &gate, 0, 0, 0, nullptr));
    EXPECT_EQ(EBUSY, thread.LastError());

    ScopedSysCalls restore(Sys());
    Sys().pthread_cond_timedwait = [](pthread_cond_t*, pthread_mutex_t*, const timespec*) { return ETIMEDOUT; };
    result = nullptr;
    EXPECT_EQ(-5, thread.Wait(&result, nullptr, 1));
    EXPECT_EQ(ETIMEDOUT, thread.LastError());
    EXPECT_EQ(nullptr, result);

    // A join that fails leaves the thread to a later Wait.
    Sys().pthread_join = [](pthread_t, void**) { return EDEADLK; };
    EXPECT_EQ(-1, thread.Wait(&result, nullptr, -1));
    EXPECT_EQ(EDEADLK, thread.LastError());

    // While a Wait joins, a Detach and another Wait are refused.
    g_joined = &thread;
    Sys().pthread_join = [](pthread_t target, void** value) {
        g_refusals = {g_joined->Detach(), g_joined->LastError(), g_joined->Wait(nullptr, nullptr, -1)};
        return pthread_join(target, value);
    };
    gate.open.Signal();
    EXPECT_EQ(0, thread.Wait(&result, nullptr, 0));
    EXPECT_EQ(Refusals({-1, EINVAL, -1}), g_refusals);
    EXPECT_EQ(Line(EBUSY) + Line(EDEADLK) + Line(EINVAL) + Line(EINVAL), capture.Text());
    EXPECT_EQ(&g_answer, result);
    EXPECT_EQ(0UL, static_cast<unsigned long>(thread));
    EXPECT_FALSE(thread.Exists());
    EXPECT_EQ(-1, thread.Wait(&result, nullptr, -1));
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
    EXPECT_EQ(0, thread.Pause(nullptr, -1));  // not a wrap into a pause of 71 minutes
    const auto start = std::chrono::steady_clock::now();
    EXPECT_EQ(0, thread.Pause(nullptr, 20));
    EXPECT_GE(std::chrono::steady_clock::now() - start, std::chrono::milliseconds(20));

    CaptureStderr capture;
    thread.Cancel();
    EXPECT_EQ(ESRCH, thread.LastError());
    EXPECT_EQ(1, thread.m_cancelled);
    EXPECT_EQ(-6, thread.Pause(nullptr, 0));
    {
        // A failed start leaves the object as it was, and EAGAIN is silent.
        // The stack size asked for is in the attributes of the start.
        ScopedSysCalls restore(Sys());
        Sys().pthread_create = [](pthread_t*, const pthread_attr_t* attr, void* (*)(void*), void*) {
            size_t size = 0;
            return pthread_attr_getstacksize(attr, &size) == 0 && size == 1 << 20 ? EAGAIN : EINVAL;
        };
        EXPECT_EQ(-1, thread.Create(WaitAtGate, nullptr, 1 << 20, 0, 0, nullptr));
        EXPECT_EQ(EAGAIN, thread.LastError());
        EXPECT_EQ(0, thread.m_state);
    }
    int err = 0;
    EXPECT_EQ(-1, thread.Kill(&err));
    EXPECT_EQ(ESRCH, err);
    EXPECT_EQ("", capture.Text());

    // Self adopts the calling thread, and leaves it joinable for its maker.
    EXPECT_TRUE(OnOtherThread([] {
        MThread host;
        return host.Self() == MThread::ThreadID() && static_cast<unsigned long>(host) == pthread_self() &&
               host.Exists();
    }));
}

// Detached at Create or by Detach: the object lets go of the thread at once.
TEST(MThread, DetachedThreadIsGivenUpAtOnce)
{
    for (int atCreate : {1, 0}) {
        Gate gate;
        MThread thread;
        ASSERT_EQ(0, thread.Create(WaitAtGate, &gate, 0, atCreate, 0, nullptr));
        if (atCreate == 0) {
            // The status is Detach's own, not an older error's.
            thread.StoreLastError(EPERM);
            EXPECT_EQ(0, thread.Detach());
            EXPECT_EQ(0, thread.LastError());
        }
        EXPECT_EQ(3, thread.m_state);
        EXPECT_EQ(0UL, static_cast<unsigned long>(thread));
        EXPECT_FALSE(thread.Exists());
        EXPECT_EQ(-1, thread.Wait(nullptr, nullptr, 0));
        gate.open.Signal();
        WaitUntilFinished(thread);
    }
}

// The request is made while the routine holds cancellation off, and takes
// effect when the routine pauses: Cancel and Kill end the thread there (it
// lets itself go, so Wait gives 3). Kill leaves its caller's own
// cancellation as it found it and never signals the process. A routine that
// keeps cancellation off sees the flag that Cancel set: its pause ends at
// once with -6 and the routine returns.
TEST(MThread, CancelAndKillTakeEffectInThePause)
{
    struct Pauser {
        MThread thread;
        Gate gate;
        bool cancellable;
        int pauseStatus = 99;
    };
    for (int how : {0, 1, 2}) {
        Pauser pauser;
        pauser.cancellable = how != 2;
        ASSERT_EQ(0, pauser.thread.Create(
                         [](void* arg) -> void* {
                             auto& self = *static_cast<Pauser*>(arg);
                             pthread_setcancelstate(PTHREAD_CANCEL_DISABLE, nullptr);
                             self.gate.open.Wait();
                             pthread_setcancelstate(self.cancellable ? PTHREAD_CANCEL_ENABLE : PTHREAD_CANCEL_DISABLE,
                                                    nullptr);
                             self.pauseStatus = self.thread.Pause(nullptr, 5000);
                             return nullptr;
                         },
                         &pauser, 0, 0, 0, nullptr));
        if (how == 1) {
            int err = -1;
            int state = -1;
            int type = -1;
            EXPECT_EQ(0, OnOtherThread([&] {
                          pthread_setcancelstate(PTHREAD_CANCEL_DISABLE, nullptr);
                          const int status = pauser.thread.Kill(&err);
                          pthread_setcancelstate(PTHREAD_CANCEL_DISABLE, &state);
                          pthread_setcanceltype(PTHREAD_CANCEL_DEFERRED, &type);
                          return status;
                      }));
            EXPECT_EQ(0, err);
            EXPECT_EQ(PTHREAD_CANCEL_DISABLE, state);
            EXPECT_EQ(PTHREAD_CANCEL_DEFERRED, type);
        } else {
            pauser.thread.Cancel();
            EXPECT_EQ(0, pauser.thread.LastError());
        }
        ScopedSysCalls restore(Sys());
        g_openOnWait = &pauser.gate;
        Sys().pthread_cond_wait = OpenGateAndWait;
        EXPECT_EQ(how == 2 ? 0 : 3, pauser.thread.Wait(nullptr, nullptr, 0)) << how;
        EXPECT_EQ(how == 2 ? -6 : 99, pauser.pauseStatus);
        EXPECT_EQ(how == 2 ? 1 : 3, pauser.thread.m_state);
        EXPECT_EQ(1, pauser.thread.m_cancelled);
        EXPECT_FALSE(pauser.thread.Exists());
    }
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

TEST(MThread, OnceRunsItsRoutineOnce)
{
    static int calls;
    calls = 0;
    int control = 0;
    EXPECT_EQ(0, MThread::Once([] { ++calls; }, &control));
    EXPECT_EQ(0, MThread::Once([] { ++calls; }, &control));
    EXPECT_EQ(1, calls);
    CaptureStderr capture;
    EXPECT_EQ(-1, MThread::Once([] {}, nullptr));
}
