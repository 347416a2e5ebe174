// Eight threads for a few seconds over shared configuration objects and the
// thread classes; what they did must add up afterwards.
#include <array>
#include <atomic>
#include <chrono>
#include <map>
#include <string>

#include <gtest/gtest.h>

#include "config/temp_dir.h"
#include "tessaline/config/rvConfig.h"
#include "tessaline/thread/MThread.h"

namespace {

using tessaline::test::ConfigDir;
using Clock = std::chrono::steady_clock;

constexpr int kThreads = 8;
constexpr int kObjects = 2;
constexpr int kKeysPerThread = 32;
constexpr auto kRunTime = std::chrono::milliseconds(2500);
constexpr long kWaitMilliseconds = 1000;

// What all workers share.
struct Shared {
    rvConfig* configs[kObjects];
    Clock::time_point end;
    MSemaphore semaphore{0, 0};
    // A queue of tokens: produced under `queueLock`, taken by waiting on `ready`.
    MMutex queueLock{MMutex_::MutexPlain};
    MCondVar ready;
    int pending = 0;
    int stopped = 0;
};

// What one worker did, for the checks at the end. Only its own thread
// writes it while it runs.
struct Worker {
    Shared* shared = nullptr;
    MThread* self = nullptr;
    int index = 0;
    int errors = 0;
    long stores[kObjects] = {};
    long increments[kObjects] = {};
    long flushes = 0;
    long signals = 0;
    long takes = 0;
    long produced = 0;
    long consumed = 0;
    // Last value stored per key, -1 for none.
    std::array<std::array<int, kKeysPerThread>, kObjects> last;
};

std::string keyName(int k)
{
    return "k" + std::to_string(k);
}

std::string sectionOf(int worker)
{
    return "t" + std::to_string(worker);
}

// Counts every key by enumeration and compares with the counts; the caller
// holds the class lock, so nothing changes underneath.
bool enumerationAddsUp(rvConfig& config)
{
    unsigned int enumerated = 0;
    unsigned int counted = 0;
    unsigned int sections = 0;
    for (const char* s = config.EnumSections(1); s != nullptr; s = config.EnumSections(0)) {
        ++sections;
        counted += config.TokenCnt(s);
        for (const char* k = config.EnumTokens(s, 1); k != nullptr; k = config.EnumTokens(s, 0)) {
            ++enumerated;
        }
    }
    return enumerated == counted && sections == config.SectionCnt();
}

void useConfig(Worker& w, int n)
{
    const int o = n % kObjects;
    rvConfig& config = *w.shared->configs[o];
    const int k = (n / kObjects) % kKeysPerThread;
    const std::string key = keyName(k);
    const std::string section = sectionOf(w.index);

    config.PutValue(key.c_str(), n, section.c_str());
    w.last[o][k] = n;
    ++w.stores[o];
    if (config.GetValue(key.c_str(), -1, section.c_str()) != n) {
        ++w.errors;
    }
    if (n % 4 == 0) {
        // A read-modify-write that only a bracket makes safe.
        config.Lock();
        const int counter = config.GetValue("counter", -1, "common");
        config.PutValue("counter", counter + 1, "common");
        config.Unlock();
        ++w.increments[o];
        ++w.stores[o];
    }
    if (n % 8 == 0) {
        config.Lock();
        const char* text = config.GetValue(key.c_str(), "missing", section.c_str());
        if (!enumerationAddsUp(config) || std::to_string(n) != text) {
            ++w.errors;
        }
        config.Unlock();
    }
    if (n % 512 == 0) {
        w.errors += config.Flush(0) == 1 ? 0 : 1;
        ++w.flushes;
    }
}

void useThreadClasses(Worker& w, int n)
{
    Shared& shared = *w.shared;
    shared.semaphore.Signal();
    ++w.signals;
    if (n % 2 == 0 && shared.semaphore.Try() == 0) {
        ++w.takes;
    }

    shared.queueLock.Lock(nullptr);
    ++shared.pending;
    ++w.produced;
    shared.ready.Signal(nullptr);
    shared.queueLock.Unlock(nullptr);

    shared.queueLock.Lock(nullptr);
    while (shared.pending == 0 && shared.stopped == 0) {
        shared.ready.Wait(shared.queueLock, nullptr, kWaitMilliseconds);
    }
    if (shared.pending > 0) {
        --shared.pending;
        ++w.consumed;
    }
    shared.queueLock.Unlock(nullptr);

    if (w.self->Pause(nullptr, 0) != 0) {
        ++w.errors;
    }
}

void* work(void* arg)
{
    Worker& w = *static_cast<Worker*>(arg);
    for (auto& keys : w.last) {
        keys.fill(-1);
    }
    for (int n = 0; Clock::now() < w.shared->end; ++n) {
        useConfig(w, n);
        useThreadClasses(w, n);
    }
    w.shared->queueLock.Lock(nullptr);
    ++w.shared->stopped;
    w.shared->ready.Broadcast(nullptr);
    w.shared->queueLock.Unlock(nullptr);
    return arg;
}

// Every section and key of `config`, with its value.
std::map<std::string, std::string> contents(rvConfig& config)
{
    std::map<std::string, std::string> all;
    for (const char* s = config.EnumSections(1); s != nullptr; s = config.EnumSections(0)) {
        for (const char* k = config.EnumTokens(s, 1); k != nullptr; k = config.EnumTokens(s, 0)) {
            all[std::string(s) + "/" + k] = config.GetValue(k, "", s);
        }
    }
    return all;
}

TEST(Stress, SharedConfigurationsAndThreadClasses)
{
    ConfigDir dir;
    rvConfig first(dir.Write("first.ini", "# shared\n[common]\ncounter = 0\n").c_str(), rvConfig::OpenUpdate);
    rvConfig second(dir.Write("second.ini", "# shared\n[common]\ncounter = 0\n").c_str(), rvConfig::OpenUpdate);
    Shared shared;
    ASSERT_EQ(shared.semaphore.Init(0), 0);
    shared.configs[0] = &first;
    shared.configs[1] = &second;
    const unsigned int itemsBefore[kObjects] = {first.IsValid(), second.IsValid()};
    const int threadsBefore = MThread_::m_threadCnt;

    Worker workers[kThreads];
    {
        MThread threads[kThreads];
        EXPECT_EQ(MThread_::m_threadCnt, threadsBefore + kThreads);
        shared.end = Clock::now() + kRunTime;
        for (int i = 0; i < kThreads; ++i) {
            workers[i].shared = &shared;
            workers[i].self = &threads[i];
            workers[i].index = i;
            ASSERT_EQ(threads[i].Create(work, &workers[i], 0, 0, 0, nullptr), 0);
        }
        for (int i = 0; i < kThreads; ++i) {
            int* result = nullptr;
            EXPECT_EQ(threads[i].Wait(&result, nullptr, 0), 0);
            EXPECT_EQ(result, reinterpret_cast<int*>(&workers[i]));
            EXPECT_FALSE(threads[i].Exists());
        }
    }
    EXPECT_EQ(MThread_::m_threadCnt, threadsBefore);

    long signals = 0, takes = 0, produced = 0, consumed = 0, flushes = 0;
    for (const Worker& w : workers) {
        SCOPED_TRACE("worker " + std::to_string(w.index));
        EXPECT_EQ(w.errors, 0);
        signals += w.signals;
        takes += w.takes;
        produced += w.produced;
        consumed += w.consumed;
        flushes += w.flushes;
        for (int o = 0; o < kObjects; ++o) {
            unsigned int keys = 0;
            for (int k = 0; k < kKeysPerThread; ++k) {
                if (w.last[o][k] >= 0) {
                    ++keys;
                    EXPECT_EQ(shared.configs[o]->GetValue(keyName(k).c_str(), -1, sectionOf(w.index).c_str()),
                              w.last[o][k]);
                }
            }
            EXPECT_EQ(shared.configs[o]->TokenCnt(sectionOf(w.index).c_str()), keys);
        }
    }
    EXPECT_GT(flushes, 0);
    EXPECT_EQ(shared.semaphore.Count(), signals - takes);
    EXPECT_EQ(produced, consumed + shared.pending);

    for (int o = 0; o < kObjects; ++o) {
        SCOPED_TRACE("object " + std::to_string(o));
        rvConfig& config = *shared.configs[o];
        long stores = 0, increments = 0;
        for (const Worker& w : workers) {
            stores += w.stores[o];
            increments += w.increments[o];
        }
        EXPECT_EQ(config.GetValue("counter", -1, "common"), increments);
        EXPECT_EQ(config.IsValid(), itemsBefore[o] + stores);
        // What is on disk after a last flush is what is in memory.
        ASSERT_EQ(config.Flush(0), 1u);
        rvConfig reread(config.ConfigName(), rvConfig::OpenRead);
        EXPECT_EQ(contents(reread), contents(config));
    }
}

}  // namespace
