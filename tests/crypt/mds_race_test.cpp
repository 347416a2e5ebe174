// Several threads meet the first reKey of the process at once. Run under
// ThreadSanitizer: the one-time fill of MDStab must not race, and every
// thread must key from a complete table. Nothing else in this executable
// keys a cipher before this test.
#include <atomic>
#include <string>
#include <thread>

#include <gtest/gtest.h>

#include "tessaline/crypt/rvEncrypt.h"
#include "tessaline/crypt/twofish.h"

TEST(MdsTable, FirstKeyingFromManyThreads)
{
    ASSERT_EQ(1, __atomic_load_n(&needToBuildMDS, __ATOMIC_ACQUIRE)) << "table already built";
    constexpr int kThreads = 8;
    std::atomic<int> waiting{kThreads};
    std::string results[kThreads];
    std::thread threads[kThreads];
    for (int t = 0; t < kThreads; ++t) {
        threads[t] = std::thread([&, t] {
            for (waiting.fetch_sub(1); waiting.load() > 0;)
                std::this_thread::yield();
            // Half key the engine directly, half through the text form.
            unsigned char block[16] = {};
            if (t % 2 == 0) {
                keyInstance key = {};
                makeKey(&key, DIR_ENCRYPT, 128, nullptr);
                reKey(&key);
                cipherInstance cipher;
                cipherInit(&cipher, MODE_ECB, nullptr);
                blockEncrypt(&cipher, &key, block, 128, block);
                results[t] = std::string(reinterpret_cast<char*>(block), 16);
            } else {
                unsigned char hello[] = "Hello World!";
                char text[64];
                rvEncrypt(hello, 12, text);
                results[t] = text;
            }
        });
    }
    for (std::thread& thread : threads)
        thread.join();

    EXPECT_EQ(0, __atomic_load_n(&needToBuildMDS, __ATOMIC_ACQUIRE));
    const std::string zeroKeyBlock = "\xA2\xFB\x66\x0C\x9A\x92\xBA\xF3\x45\x29\xFD\x18\xD9\x9B\x81\xAE";
    for (int t = 0; t < kThreads; ++t)
        EXPECT_EQ(t % 2 == 0 ? zeroKeyBlock : "D9F35E45F0B32BB01E0F8FA0FC5041E80CAB", results[t]) << t;
}
