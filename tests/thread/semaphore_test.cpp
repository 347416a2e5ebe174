#include <cerrno>
#include <csignal>
#include <string>
#include <thread>

#include <gtest/gtest.h>

#include "support/capture_stderr.h"
#include "tessaline/tessaline.h"

using tessaline::test::CaptureStderr;

TEST(MSemaphore, CountsTakesAndGivesBackUpTo32767)
{
    // The thread objects' semaphore is made when the library loads.
    EXPECT_EQ(64, MThread::m_thrdSemaphore.Count());

    MSemaphore semaphore(3, 0);
    EXPECT_EQ(0, semaphore.Wait());
    EXPECT_EQ(0, semaphore.Try());
    EXPECT_EQ(1, semaphore.Count());
    EXPECT_EQ(0, semaphore.Signal());
    MSemaphore::Cleanup(&semaphore.m_sem);
    EXPECT_EQ(3, semaphore.Count());

    EXPECT_EQ(0, semaphore.Init(32768));
    EXPECT_EQ(32767, semaphore.Count());
    EXPECT_EQ(32767, MSemaphore(100000, 0).Count());

    // An empty semaphore refuses Try silently.
    EXPECT_EQ(0, semaphore.Init(0));
    CaptureStderr capture;
    EXPECT_EQ(-1, semaphore.Try());
    EXPECT_EQ(EAGAIN, semaphore.LastError());
    EXPECT_EQ("", capture.Text());
}

TEST(MSemaphore, NoPlatformObjectUntilInit)
{
    MSemaphore semaphore(0, 0);
    {
        CaptureStderr capture;
        EXPECT_EQ(-1, semaphore.Count());
        EXPECT_EQ(-1, semaphore.Try());
        EXPECT_EQ(-1, semaphore.Signal());
        EXPECT_EQ(EINVAL, semaphore.LastError());
        EXPECT_EQ(-1, semaphore.Init(-1));
        EXPECT_EQ(-1, semaphore.Count());
        EXPECT_NE(std::string::npos, capture.Text().find("(22)\n"));
    }
    EXPECT_EQ(0, semaphore.Init(0));
    EXPECT_EQ(0, semaphore.Signal());
    EXPECT_EQ(1, semaphore.Count());
}

TEST(MSemaphore, WaitOutlastsAnInterruptingSignal)
{
    struct sigaction action = {};
    action.sa_handler = [](int) {};  // no SA_RESTART: sem_wait sees EINTR
    struct sigaction previous = {};
    ASSERT_EQ(0, sigaction(SIGUSR1, &action, &previous));

    MSemaphore semaphore(0, 0);
    ASSERT_EQ(0, semaphore.Init(0));
    int status = -99;
    std::thread waiter([&] { status = semaphore.Wait(); });
    std::this_thread::sleep_for(std::chrono::milliseconds(50));
    pthread_kill(waiter.native_handle(), SIGUSR1);
    std::this_thread::sleep_for(std::chrono::milliseconds(50));
    EXPECT_EQ(0, semaphore.Signal());
    waiter.join();
    EXPECT_EQ(0, status);
    EXPECT_EQ(0, semaphore.Count());
    sigaction(SIGUSR1, &previous, nullptr);
}
