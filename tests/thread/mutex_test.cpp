#include <cerrno>
#include <cstring>
#include <string>

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

std::string ExpectedLine(int code)
{
    char line[256];
    std::snprintf(line, sizeof line, "Thread #%d error: %s (%d)\n", static_cast<int>(pthread_self()),
                  std::strerror(code), code);
    return line;
}

}  // namespace

TEST(CheckSyserror, RoutineCodesAreSilentOthersWriteOneLine)
{
    CaptureStderr capture;
    EXPECT_EQ(0, CHECK_SYSERROR(0));
    for (int code : {ENOENT, ESRCH, EAGAIN, EBUSY, -2}) {
        EXPECT_EQ(-1, CHECK_SYSERROR(code));
    }
    EXPECT_EQ(ExpectedLine(EBUSY) + ExpectedLine(-2), capture.Text());
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
    {
        CaptureStderr quiet;
        EXPECT_EQ(0, mutex.Unlock(nullptr));
        EXPECT_EQ(0, mutex.Unlock(nullptr));
        EXPECT_EQ(-1, OnOtherThread([&] { return mutex.Try(nullptr); }));
    }
    EXPECT_EQ(0, mutex.Unlock(nullptr));
    EXPECT_EQ(0, mutex.Locked());
    EXPECT_EQ(0, OnOtherThread([&] {
                  int status = mutex.Try(nullptr);
                  return status == 0 ? mutex.Unlock(nullptr) : status;
              }));
}

TEST(MMutex, CheckedRefusesHolderAndOthersWithoutQueueing)
{
    MMutex mutex(MMutex_::MutexChecked);
    ASSERT_EQ(0, mutex.Lock(nullptr));
    CaptureStderr capture;
    EXPECT_EQ(2, mutex.Lock(nullptr));
    EXPECT_EQ(-2, mutex.LastError());
    EXPECT_EQ(2, OnOtherThread([&] { return mutex.Lock(nullptr); }));
    EXPECT_EQ(2, OnOtherThread([&] { return mutex.Try(nullptr); }));
    EXPECT_EQ(1, mutex.m_count);
    EXPECT_EQ("", capture.Text());
    EXPECT_EQ(0, mutex.Unlock(nullptr));
}

TEST(MMutex, UnlockRefusalsLeaveMinusTwoAndWriteNothing)
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
        EXPECT_EQ(0, mutex.Unlock(nullptr));
        EXPECT_EQ("", capture.Text());
    }
}

TEST(MMutex, TryOnMutexHeldElsewhereReportsEbusyOnce)
{
    for (auto type : {MMutex_::MutexPlain, MMutex_::MutexRecursive}) {
        MMutex mutex(type);
        ASSERT_EQ(0, mutex.Try(nullptr));
        EXPECT_EQ(-1, OnOtherThread([&] {
            CaptureStderr capture;
            const int status = mutex.Try(nullptr);
            EXPECT_EQ(ExpectedLine(EBUSY), capture.Text());
            return status;
        }));
        EXPECT_EQ(EBUSY, mutex.LastError());
        EXPECT_EQ(0, mutex.Unlock(nullptr));
    }
}

// A failed platform call reaches the caller as -1 with its code, and the
// record of a tracked mutex stays free.
TEST(MMutex, PlatformFailuresAreReportedAndTakeNothing)
{
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
        EXPECT_EQ(ExpectedLine(EDEADLK) + ExpectedLine(EINVAL), capture.Text()) << type;
    }
    // Create reports each call as it comes, and the last one again as its status.
    Sys().pthread_mutex_init = [](pthread_mutex_t*, const pthread_mutexattr_t*) { return ENOMEM; };
    CaptureStderr capture;
    MMutex broken(MMutex_::MutexPlain);
    EXPECT_EQ(ENOMEM, broken.LastError());
    EXPECT_EQ(ExpectedLine(ENOMEM) + ExpectedLine(ENOMEM) + ExpectedLine(ENOMEM), capture.Text());
}

TEST(MMutex, TypeOutsideTheEnumerationTakesNothing)
{
    MMutex mutex(static_cast<MMutex_::MutexType>(7));
    EXPECT_EQ(0, mutex.Try(nullptr));
    EXPECT_EQ(0, mutex.Lock(nullptr));
    // Nothing was taken, so the platform mutex is free.
    EXPECT_EQ(0, pthread_mutex_trylock(&mutex.m_mutex));
    pthread_mutex_unlock(&mutex.m_mutex);
}
