// Its own executable: the first call of the counter must happen here.
#include <atomic>
#include <chrono>
#include <thread>
#include <vector>

#include <gtest/gtest.h>

#include "tessaline/util/rvTime.h"

TEST(TickCount, FirstCallsRaceAndTheFirstReturnsZero)
{
    std::atomic<bool> go{false};
    std::vector<unsigned long> seen(4, 0xdead);
    std::vector<std::thread> threads;
    for (unsigned long& result : seen) {
        threads.emplace_back([&go, &result] {
            while (!go.load()) {
                std::this_thread::yield();
            }
            result = _gettickcount();
        });
    }
    go = true;
    for (std::thread& thread : threads) {
        thread.join();
    }
    int zeros = 0;
    for (unsigned long result : seen) {
        zeros += result == 0;
        EXPECT_LT(result, 1000000ul);
    }
    EXPECT_GE(zeros, 1);
}

TEST(TickCount, CountsMicroseconds)
{
    const unsigned long before = _gettickcount();
    std::this_thread::sleep_for(std::chrono::milliseconds(200));
    const unsigned long elapsed = (_gettickcount() - before) & 0xfffffffful;
    EXPECT_GE(elapsed, 200000ul);
    EXPECT_LT(elapsed, 5000000ul);
}
