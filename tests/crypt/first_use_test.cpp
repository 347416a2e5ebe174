// Threads meet the engine's one-time table and the text forms' one-time
// schedule at once. Run under ThreadSanitizer: neither fill may race, and
// every thread must see complete tables. Nothing else in this executable
// keys a cipher before this test.
#include <atomic>
#include <string>
#include <thread>

#include <gtest/gtest.h>

#include "tessaline/crypt/rvEncrypt.h"
#include "tessaline/crypt/twofish.h"

TEST(FirstUse, ManyThreadsKeyAtOnce)
{
    ASSERT_EQ(1, __atomic_load_n(&needToBuildMDS, __ATOMIC_ACQUIRE)) << "table already built";
    // What each of the three kinds of thread below must come to.
    const std::string expected[3] = {"\xA2\xFB\x66\x0C\x9A\x92\xBA\xF3\x45\x29\xFD\x18\xD9\x9B\x81\xAE",
                                     "D9F35E45F0B32BB01E0F8FA0FC5041E80CAB", "Hello World!"};

    constexpr int kThreads = 9;
    std::atomic<int> waiting{kThreads};
    std::string results[kThreads];
    std::thread threads[kThreads];
    for (int t = 0; t < kThreads; ++t) {
        threads[t] = std::thread([&, t] {
            for (waiting.fetch_sub(1); waiting.load() > 0;)
                std::this_thread::yield();
            // A third key the engine directly, a third encrypt text and a
            // third decrypt it.
            if (t % 3 == 0) {
                unsigned char block[16] = {};
                keyInstance key = {};
                makeKey(&key, DIR_ENCRYPT, 128, nullptr);
                reKey(&key);
                cipherInstance cipher;
                cipherInit(&cipher, MODE_ECB, nullptr);
                blockEncrypt(&cipher, &key, block, 128, block);
                results[t].assign(reinterpret_cast<char*>(block), 16);
            } else if (t % 3 == 1) {
                std::string value = expected[2];
                char text[64];
                rvEncrypt(reinterpret_cast<unsigned char*>(&value[0]), value.size(), text);
                results[t] = text;
            } else {
                std::string text = expected[1];
                unsigned char value[32];
                unsigned long length = sizeof value;
                rvDecrypt(&text[0], value, &length, nullptr);
                results[t].assign(reinterpret_cast<char*>(value), length);
            }
        });
    }
    for (std::thread& thread : threads)
        thread.join();

    EXPECT_EQ(0, __atomic_load_n(&needToBuildMDS, __ATOMIC_ACQUIRE));
    for (int t = 0; t < kThreads; ++t)
        EXPECT_EQ(expected[t % 3], results[t]) << t;
}
