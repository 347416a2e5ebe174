#include <cerrno>
#include <string>

#include <gtest/gtest.h>

#include "support/capture_stderr.h"
#include "support/scoped_sys_calls.h"
#include "tessaline/tessaline.h"
#include "thread/sys.h"

using tessaline::test::CaptureStderr;
using tessaline::testing::ScopedSysCalls;
using tessaline::thread::Sys;

namespace {

int Fail(int code)
{
    errno = code;
    return -1;
}

}  // namespace

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

// The semaphore calls report through errno; a wait that a signal handler
// interrupts goes on waiting.
TEST(MSemaphore, PlatformFailuresBecomeTheStatusAndTheLastError)
{
    static int interruptions;
    MSemaphore semaphore(1, 0);
    ScopedSysCalls restore(Sys());
    Sys().sem_wait = [](sem_t*) { return Fail(--interruptions >= 0 ? EINTR : EINVAL); };
    Sys().sem_post = [](sem_t*) { return Fail(EOVERFLOW); };
    Sys().sem_init = [](sem_t*, int, unsigned int) { return Fail(ENOSYS); };
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
    const std::string text = capture.Text();
    for (int code : {EINVAL, EOVERFLOW, ENOSYS}) {
        EXPECT_NE(std::string::npos, text.find("(" + std::to_string(code) + ")\n")) << code;
    }
}
