// The class lock: one recursive lock for all objects.
#include <atomic>
#include <chrono>
#include <thread>

#include <gtest/gtest.h>

#include "tessaline/config/rvConfig.h"

namespace {

TEST(RvConfigLock, HeldBracketMakesOtherThreadsWait)
{
    rvConfig held;
    rvConfig other;
    other.PutValue("k", "v", "");
    std::atomic<bool> done(false);

    held.Lock();
    held.PutValue("inside", "1", "");  // re-entered by the holder
    std::thread reader([&] {
        EXPECT_STREQ(other.GetValue("k", "d", ""), "v");
        done = true;
    });
    std::this_thread::sleep_for(std::chrono::milliseconds(100));
    EXPECT_FALSE(done);
    held.Unlock();
    reader.join();
    EXPECT_TRUE(done);
}

TEST(RvConfigLock, SharedObjectUnderConcurrentStores)
{
    rvConfig config;
    std::thread writers[4];
    for (int t = 0; t < 4; ++t) {
        writers[t] = std::thread([&config, t] {
            const std::string section = "s" + std::to_string(t);
            for (int i = 0; i < 200; ++i) {
                config.PutValue(("k" + std::to_string(i)).c_str(), "v", section.c_str());
                rvConfig::cfgStr value;
                config._GetValue(rvConfig::cfgStr("k0"), &value, rvConfig::cfgStr(section.c_str()));
            }
        });
    }
    for (std::thread& writer : writers) {
        writer.join();
    }
    EXPECT_EQ(config.SectionCnt(), 5u);
    EXPECT_EQ(config.TokenCnt("s3"), 200u);
    EXPECT_EQ(config.IsValid(), 801u);
}

}  // namespace
