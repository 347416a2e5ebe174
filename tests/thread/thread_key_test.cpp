#include <cerrno>
#include <thread>

#include <gtest/gtest.h>

#include "support/capture_stderr.h"
#include "tessaline/tessaline.h"
#include "thread/thread_test_support.h"

using tessaline::test::CaptureStderr;
using tessaline::test::OnOtherThread;

namespace {

void* g_exitValue = nullptr;

void RememberExitValue(void* value)
{
    g_exitValue = value;
}

}  // namespace

TEST(MThreadKey, EachThreadSeesItsOwnValueAndItsDestructorGetsIt)
{
    unsigned int number = 0;
    {
        MThreadKey key;
        ASSERT_EQ(0, key.Create(reinterpret_cast<void (*)()>(&RememberExitValue), 0, nullptr));
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
        EXPECT_EQ(&theirs, g_exitValue);
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
