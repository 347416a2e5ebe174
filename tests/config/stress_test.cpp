// Threads sharing configuration objects: the class lock, and eight threads
// storing, reading, enumerating and flushing, whose work must add up.
#include <atomic>
#include <chrono>
#include <string>
#include <thread>
#include <vector>

#include <gtest/gtest.h>

#include "config/temp_dir.h"
#include "tessaline/config/rvConfig.h"

namespace {

using tessaline::test::ConfigDir;

constexpr int kThreads = 8;
constexpr int kRounds = 3000;
constexpr int kKeysPerThread = 32;

// One lock for all objects: a bracket on one holds up calls on another.
TEST(RvConfigLock, HeldBracketMakesOtherObjectsWait)
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
    std::this_thread::sleep_for(std::chrono::milliseconds(50));
    EXPECT_FALSE(done);
    held.Unlock();
    reader.join();
    EXPECT_TRUE(done);
}

TEST(Stress, SharedConfigurations)
{
    ConfigDir dir;
    rvConfig first(dir.Write("first.ini", "# shared\n[common]\ncounter = 0\n").c_str(), rvConfig::OpenUpdate);
    rvConfig second(dir.Write("second.ini", "# shared\n[common]\ncounter = 0\n").c_str(), rvConfig::OpenUpdate);
    rvConfig* configs[] = {&first, &second};
    const unsigned int itemsBefore = first.IsValid();
    std::atomic<int> errors(0);
    std::vector<std::thread> threads;
    for (int t = 0; t < kThreads; ++t) {
        threads.emplace_back([&, t] {
            const std::string section = "t" + std::to_string(t);
            for (int n = 0; n < kRounds; ++n) {
                // Odd and even rounds go to the two objects; `round` counts per object.
                rvConfig& config = *configs[n % 2];
                const int round = n / 2;
                const std::string key = "k" + std::to_string(round % kKeysPerThread);
                config.PutValue(key.c_str(), n, section.c_str());
                errors += config.GetValue(key.c_str(), -1, section.c_str()) != n;
                if (round % 2 == 0) {
                    // A read-modify-write that only a bracket makes safe.
                    config.Lock();
                    config.PutValue("counter", config.GetValue("counter", -1, "common") + 1, "common");
                    config.Unlock();
                }
                if (round % 4 == 0) {
                    config.Lock();
                    unsigned int keys = 0;
                    for (const char* s = config.EnumSections(1); s != nullptr; s = config.EnumSections(0)) {
                        keys += config.TokenCnt(s);
                        for (const char* k = config.EnumTokens(s, 1); k != nullptr; k = config.EnumTokens(s, 0)) {
                            --keys;
                        }
                    }
                    errors += keys != 0;
                    config.Unlock();
                }
                if (round % 256 == 0) {
                    errors += config.Flush(0) != 1;
                }
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(errors, 0);
    for (rvConfig* config : configs) {
        // Each thread had half its rounds here and counted in half of those.
        const int increments = kRounds / 4;
        const int stores = kRounds / 2 + increments;
        EXPECT_EQ(config->GetValue("counter", -1, "common"), kThreads * increments);
        EXPECT_EQ(config->IsValid(), itemsBefore + unsigned(kThreads * stores));
        for (int t = 0; t < kThreads; ++t) {
            EXPECT_EQ(config->TokenCnt(("t" + std::to_string(t)).c_str()), unsigned(kKeysPerThread));
        }
        // The last flush writes what is in memory.
        ASSERT_EQ(config->Flush(0), 1u);
        rvConfig reread(config->ConfigName(), rvConfig::OpenRead);
        EXPECT_EQ(reread.GetValue("counter", -1, "common"), kThreads * increments);
        const std::string lastKey = "k" + std::to_string((kRounds / 2 - 1) % kKeysPerThread);
        EXPECT_EQ(reread.GetValue(lastKey.c_str(), -1, "t7"), kRounds - 2 + (config == &second));
    }
}

}  // namespace
