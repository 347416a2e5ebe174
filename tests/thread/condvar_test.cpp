#include <cerrno>
#include <string>
#include <thread>

#include <gtest/gtest.h>

#include "support/capture_stderr.h"
#include "tessaline/tessaline.h"
#include "thread/thread_test_support.h"

using tessaline::test::CaptureStderr;
using tessaline::test::OnOtherThread;
using tessaline::test::SecondsFor;

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

TEST(MCondVar, TimeoutsHaveAWholeSecondGrainAndEndHoldingTheMutex)
{
    struct Case {
        MMutex_::MutexType type;
        long timeout;
        double atLeast, atMost;
    };
    const Case cases[] = {
        // Upper bounds sit halfway to the next whole second: a loaded
        // machine wakes late, but never a whole second late.
        {MMutex_::MutexPlain, 1, 0, 1.5},
        {MMutex_::MutexPlain, 1999, 0, 1.5},
        {MMutex_::MutexRecursive, 2500, 0.99, 2.5},
        {MMutex_::MutexRecursive, -1, 0, 0.5},  // at once, the mutex never released
    };
    CaptureStderr capture;
    for (const Case& c : cases) {
        MMutex mutex(c.type);
        MCondVar cond;
        ASSERT_EQ(0, mutex.Lock(nullptr));
        int status = 0;
        const double seconds = SecondsFor([&] { status = cond.Wait(mutex, nullptr, c.timeout); });
        EXPECT_GE(seconds, c.atLeast) << c.timeout;
        EXPECT_LE(seconds, c.atMost) << c.timeout;
        EXPECT_EQ(-5, status);
        EXPECT_EQ(ETIMEDOUT, cond.LastError());
        EXPECT_FALSE(FreeElsewhere(mutex));
        EXPECT_EQ(0, mutex.Unlock(nullptr));
        EXPECT_TRUE(FreeElsewhere(mutex));
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
