#include <cerrno>
#include <vector>

#include <gtest/gtest.h>

#include "support/scoped_sys_calls.h"
#include "util/sys.h"

using tessaline::util::Sys;

// A signal does not shorten the pause between two tries to open a file: it
// goes on with the time left. Any other failure ends it.
TEST(PauseOneSecond, GoesOnAfterASignalWithTheTimeLeft)
{
    static std::vector<long> asked;  // each call's pause, in milliseconds
    static int failure;
    tessaline::testing::ScopedSysCalls restore(Sys());
    Sys().nanosleep = [](const timespec* pause, timespec* left) {
        asked.push_back(pause->tv_sec * 1000 + pause->tv_nsec / 1000000);
        *left = {0, 250000000};
        return asked.size() == 3 ? 0 : (errno = failure, -1);
    };
    for (int code : {EINTR, EINVAL}) {
        asked.clear();
        failure = code;
        tessaline::util::PauseOneSecond();
        const std::vector<long> expected = code == EINTR ? std::vector<long>{1000, 250, 250} : std::vector<long>{1000};
        EXPECT_EQ(expected, asked) << code;
    }
}
