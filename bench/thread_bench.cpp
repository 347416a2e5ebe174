// Thread classes against the standard library and raw POSIX threads: the
// cost of a lock and unlock, of a condition-variable round trip between two
// threads, and of starting and joining a thread. Prints the ratio of each
// Tessaline figure to its peer after the table.
#include <condition_variable>
#include <cstdio>
#include <map>
#include <mutex>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include <benchmark/benchmark.h>

#include "tessaline/tessaline.h"

namespace {

void BM_MMutexRecursive(benchmark::State& state)
{
    MMutex mutex(MMutex_::MutexRecursive);
    for (auto _ : state) {
        mutex.Lock(nullptr);
        mutex.Unlock(nullptr);
    }
}
BENCHMARK(BM_MMutexRecursive);

void BM_StdRecursiveMutex(benchmark::State& state)
{
    std::recursive_mutex mutex;
    for (auto _ : state) {
        mutex.lock();
        mutex.unlock();
    }
}
BENCHMARK(BM_StdRecursiveMutex);

void BM_MMutexPlain(benchmark::State& state)
{
    MMutex mutex(MMutex_::MutexPlain);
    for (auto _ : state) {
        mutex.Lock(nullptr);
        mutex.Unlock(nullptr);
    }
}
BENCHMARK(BM_MMutexPlain);

void BM_StdMutex(benchmark::State& state)
{
    std::mutex mutex;
    for (auto _ : state) {
        mutex.lock();
        mutex.unlock();
    }
}
BENCHMARK(BM_StdMutex);

void BM_PthreadMutex(benchmark::State& state)
{
    pthread_mutex_t mutex = PTHREAD_MUTEX_INITIALIZER;
    for (auto _ : state) {
        pthread_mutex_lock(&mutex);
        pthread_mutex_unlock(&mutex);
    }
    pthread_mutex_destroy(&mutex);
}
BENCHMARK(BM_PthreadMutex);

// One iteration: hand the turn to the other thread and wait until it hands
// it back.
void BM_MCondVarPingPong(benchmark::State& state)
{
    MMutex mutex(MMutex_::MutexPlain);
    MCondVar cond;
    int turn = 0;  // 0 this thread, 1 the other, -1 stop
    std::thread other([&] {
        mutex.Lock(nullptr);
        for (;;) {
            while (turn == 0) {
                cond.Wait(mutex, nullptr, 0);
            }
            if (turn < 0) {
                break;
            }
            turn = 0;
            cond.Broadcast(nullptr);
        }
        mutex.Unlock(nullptr);
    });
    for (auto _ : state) {
        mutex.Lock(nullptr);
        turn = 1;
        cond.Broadcast(nullptr);
        while (turn != 0) {
            cond.Wait(mutex, nullptr, 0);
        }
        mutex.Unlock(nullptr);
    }
    mutex.Lock(nullptr);
    turn = -1;
    cond.Broadcast(nullptr);
    mutex.Unlock(nullptr);
    other.join();
}
BENCHMARK(BM_MCondVarPingPong)->UseRealTime();

void BM_StdConditionVariablePingPong(benchmark::State& state)
{
    std::mutex mutex;
    std::condition_variable cond;
    int turn = 0;
    std::thread other([&] {
        std::unique_lock<std::mutex> lock(mutex);
        for (;;) {
            cond.wait(lock, [&] { return turn != 0; });
            if (turn < 0) {
                break;
            }
            turn = 0;
            cond.notify_all();
        }
    });
    for (auto _ : state) {
        std::unique_lock<std::mutex> lock(mutex);
        turn = 1;
        cond.notify_all();
        cond.wait(lock, [&] { return turn == 0; });
    }
    {
        std::lock_guard<std::mutex> lock(mutex);
        turn = -1;
        cond.notify_all();
    }
    other.join();
}
BENCHMARK(BM_StdConditionVariablePingPong)->UseRealTime();

void* Nothing(void*)
{
    return nullptr;
}

// Through the timed machinery: the condition wait on m_finished, then the
// join.
void BM_MThreadCreateWait(benchmark::State& state)
{
    for (auto _ : state) {
        MThread thread;
        thread.Create(Nothing, nullptr, 0, 0, 0, nullptr);
        thread.Wait(nullptr, nullptr, 0);
    }
}
BENCHMARK(BM_MThreadCreateWait)->UseRealTime();

// Straight to the join.
void BM_MThreadCreateJoin(benchmark::State& state)
{
    for (auto _ : state) {
        MThread thread;
        thread.Create(Nothing, nullptr, 0, 0, 0, nullptr);
        thread.Wait(nullptr, nullptr, -1);
    }
}
BENCHMARK(BM_MThreadCreateJoin)->UseRealTime();

void BM_StdThreadCreateJoin(benchmark::State& state)
{
    for (auto _ : state) {
        std::thread thread([] {});
        thread.join();
    }
}
BENCHMARK(BM_StdThreadCreateJoin)->UseRealTime();

// Keeps each run's time per iteration for the ratios.
class RatioReporter : public benchmark::ConsoleReporter {
public:
    void ReportRuns(const std::vector<Run>& runs) override
    {
        for (const Run& run : runs) {
            if (run.run_type == Run::RT_Iteration && run.iterations > 0) {
                m_nanoseconds[run.benchmark_name()] = run.GetAdjustedRealTime();
            }
        }
        ConsoleReporter::ReportRuns(runs);
    }

    void PrintRatios() const
    {
        const std::pair<const char*, const char*> pairs[] = {
            {"BM_MMutexRecursive", "BM_StdRecursiveMutex"},
            {"BM_MMutexPlain", "BM_StdMutex"},
            {"BM_MMutexPlain", "BM_PthreadMutex"},
            {"BM_MCondVarPingPong/real_time", "BM_StdConditionVariablePingPong/real_time"},
            {"BM_MThreadCreateWait/real_time", "BM_StdThreadCreateJoin/real_time"},
            {"BM_MThreadCreateJoin/real_time", "BM_StdThreadCreateJoin/real_time"},
        };
        std::printf("\nRatio to the peer (time per iteration, lower is better for Tessaline):\n");
        for (const auto& [ours, peer] : pairs) {
            const auto mine = m_nanoseconds.find(ours);
            const auto theirs = m_nanoseconds.find(peer);
            if (mine != m_nanoseconds.end() && theirs != m_nanoseconds.end() && theirs->second > 0) {
                std::printf("  %-32s / %-42s %6.2f\n", ours, peer, mine->second / theirs->second);
            }
        }
    }

private:
    std::map<std::string, double> m_nanoseconds;
};

}  // namespace

int main(int argc, char** argv)
{
    benchmark::Initialize(&argc, argv);
    if (benchmark::ReportUnrecognizedArguments(argc, argv)) {
        return 1;
    }
    RatioReporter reporter;
    benchmark::RunSpecifiedBenchmarks(&reporter);
    reporter.PrintRatios();
    benchmark::Shutdown();
    return 0;
}
