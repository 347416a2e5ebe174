#include <cerrno>
#include <ctime>
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

// Whether another thread finds the platform mutex free.
bool FreeElsewhere(MMutex& mutex)
{
    return OnOtherThread([&] {
        if (pthread_mutex_trylock(&mutex.m_mutex) != 0) {
            return false;
        }
        pthread_mutex_unlock(&mutex.m_mutex);
        return true;
    });
}

}  // namespace

TEST(MCondVar, TimeoutsHaveAWholeSecondGrainFromTheCurrentSecond)
{
    static timespec deadline;
    static int calls;
    ScopedSysCalls restore(Sys());
    Sys().pthread_cond_timedwait = [](pthread_cond_t*, pthread_mutex_t*, const timespec* until) {
        deadline = *until;
        ++calls;
        return ETIMEDOUT;
    };
    struct Case {
        long timeout;
        long seconds;  // added to the current second; -1: no wait at all
    };
    const Case cases[] = {{1, 1}, {1999, 1}, {2000, 2}, {2500, 2}, {60000, 60}, {-1, -1}};
    CaptureStderr capture;
    for (const Case& c : cases) {
        MMutex mutex(MMutex_::MutexRecursive);
        MCondVar cond;
        ASSERT_EQ(0, mutex.Lock(nullptr));
        calls = 0;
        const time_t before = std::time(nullptr);
        EXPECT_EQ(-5, cond.Wait(mutex, nullptr, c.timeout)) << c.timeout;
        const time_t after = std::time(nullptr);
        EXPECT_EQ(ETIMEDOUT, cond.LastError());
        EXPECT_EQ(c.seconds < 0 ? 0 : 1, calls) << c.timeout;
        if (c.seconds >= 0) {
            EXPECT_LE(before + c.seconds, deadline.tv_sec) << c.timeout;
            EXPECT_GE(after + c.seconds, deadline.tv_sec) << c.timeout;
            EXPECT_EQ(0, deadline.tv_nsec);
        }
        EXPECT_EQ(1, mutex.m_count);
        EXPECT_EQ(0, mutex.Unlock(nullptr));
    }
    EXPECT_EQ("", capture.Text());
}

TEST(MCondVar, WaiterGetsRecursiveMutexBackWithItsRecord)
{
    for (bool signalled : {true, false}) {
        MMutex mutex(MMutex_::MutexRecursive);
        MCondVar cond;
        bool passed = false;
        ASSERT_EQ(0, mutex.Lock(nullptr));
        ASSERT_EQ(0, mutex.Lock(nullptr));
        // Passes through the mutex while the waiter sleeps: possible only
        // because the wait releases it fully, count 2 notwithstanding.
        std::thread other([&] {
            EXPECT_EQ(0, mutex.Lock(nullptr));
            passed = true;
            EXPECT_EQ(0, signalled ? cond.Signal(nullptr) : 0);
            EXPECT_EQ(0, mutex.Unlock(nullptr));
        });
        // Unsignalled, every wait times out; at least one had the other
        // thread pass through and clear the record.
        while (!passed) {
            ASSERT_EQ(signalled ? 0 : -5, cond.Wait(mutex, nullptr, signalled ? 0 : 1));
        }
        other.join();
        EXPECT_EQ(static_cast<unsigned long>(pthread_self()), mutex.m_owner);
        EXPECT_EQ(2, mutex.m_count);
        EXPECT_EQ(1, mutex.Locked());
        EXPECT_EQ(0, mutex.Unlock(nullptr));
        EXPECT_FALSE(FreeElsewhere(mutex));
        EXPECT_EQ(0, mutex.Unlock(nullptr));
        EXPECT_TRUE(FreeElsewhere(mutex));
        EXPECT_EQ(3, mutex.Unlock(nullptr));
    }
}

TEST(MCondVar, CancelledWaiterLeavesCheckedMutexFree)
{
    struct Shared {
        MMutex mutex{MMutex_::MutexChecked};
        MCondVar cond;
        MSemaphore locked{0, 0};
    } shared;
    ASSERT_EQ(0, shared.locked.Init(0));
    pthread_t waiter;
    ASSERT_EQ(0, pthread_create(
                     &waiter, nullptr,
                     [](void* arg) -> void* {
                         auto& state = *static_cast<Shared*>(arg);
                         state.mutex.Lock(nullptr);
                         state.locked.Signal();
                         state.cond.Wait(state.mutex, nullptr, 0);
                         return nullptr;
                     },
                     &shared));
    ASSERT_EQ(0, shared.locked.Wait());
    // Deferred: the request takes effect inside the condition wait.
    ASSERT_EQ(0, pthread_cancel(waiter));
    void* result = nullptr;
    ASSERT_EQ(0, pthread_join(waiter, &result));
    EXPECT_EQ(PTHREAD_CANCELED, result);
    EXPECT_EQ(0, shared.mutex.Lock(nullptr));
    EXPECT_EQ(0, shared.mutex.Unlock(nullptr));
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
    EXPECT_NE(std::string::npos, capture.Text().find("(22)\n"));
}
