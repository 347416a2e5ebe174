// Its own executable: the first call of the counter must happen here.
#include <algorithm>
#include <chrono>
#include <thread>

#include <gtest/gtest.h>

#include "tessaline/util/rvTime.h"

TEST(TickCount, FirstCallsRaceTheFirstReturnsZeroThenMicroseconds)
{
    unsigned long seen[4];
    std::thread threads[4];
    for (int i = 0; i < 4; ++i) {
        threads[i] = std::thread([&seen, i] { seen[i] = _gettickcount(); });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(0ul, *std::min_element(seen, seen + 4));
    EXPECT_LT(*std::max_element(seen, seen + 4), 1000000ul);

    const unsigned long before = _gettickcount();
    std::this_thread::sleep_for(std::chrono::milliseconds(200));
    const unsigned long elapsed = (_gettickcount() - before) & 0xfffffffful;
    EXPECT_GE(elapsed, 200000ul);
    EXPECT_LT(elapsed, 5000000ul);
}
