// A small pool of worker threads: workers take jobs from a queue guarded by
// an MMutex, sleep on an MCondVar while it is empty and report each finished
// job through an MSemaphore. Then a timed Wait on a thread that is held up.
#include <cstdio>
#include <vector>

#include "tessaline/thread/MThread.h"

namespace {

constexpr int kWorkers = 3;
constexpr int kJobs = 8;

struct Pool {
    MMutex mutex{MMutex_::MutexPlain};
    MCondVar jobsQueued;
    MSemaphore jobsDone{0, 0};  // a count of 0 makes no semaphore yet: Init below
    std::vector<int> queue;     // guarded by mutex
    bool closing = false;       // guarded by mutex
    long results[kJobs] = {};   // each slot written by the one worker that took its job
};

// The job: the sum of the squares 1..n.
void* work(void* arg)
{
    Pool& pool = *static_cast<Pool*>(arg);
    for (;;) {
        pool.mutex.Lock(nullptr);
        while (pool.queue.empty() && !pool.closing && pool.jobsQueued.Wait(pool.mutex, nullptr, 0) == 0) {
        }
        if (pool.queue.empty()) {
            pool.mutex.Unlock(nullptr);
            return nullptr;
        }
        const int job = pool.queue.back();
        pool.queue.pop_back();
        pool.mutex.Unlock(nullptr);

        for (long i = 1; i <= 10 * (job + 1); ++i) {
            pool.results[job] += i * i;
        }
        pool.jobsDone.Signal();
    }
}

// Waits until the semaphore lets it go, then answers.
void* answerWhenLetGo(void* gate)
{
    static int answer = 42;
    static_cast<MSemaphore*>(gate)->Wait();
    return &answer;
}

}  // namespace

int main()
{
    Pool pool;
    pool.jobsDone.Init(0);
    MThread workers[kWorkers];
    for (MThread& worker : workers) {
        worker.Create(work, &pool, 0, 0, 0, nullptr);
    }

    pool.mutex.Lock(nullptr);
    for (int job = 0; job < kJobs; ++job) {
        pool.queue.push_back(job);
    }
    pool.jobsQueued.Broadcast(nullptr);
    pool.mutex.Unlock(nullptr);

    for (int job = 0; job < kJobs; ++job) {
        pool.jobsDone.Wait();
    }
    // Which worker did which job varies from run to run; the results don't.
    for (int job = 0; job < kJobs; ++job) {
        std::printf("job %d: sum of squares up to %2d = %ld\n", job, 10 * (job + 1), pool.results[job]);
    }

    pool.mutex.Lock(nullptr);
    pool.closing = true;
    pool.jobsQueued.Broadcast(nullptr);
    pool.mutex.Unlock(nullptr);
    for (int i = 0; i < kWorkers; ++i) {
        std::printf("worker %d joined: %d\n", i, workers[i].Wait(nullptr, nullptr, 5000));
    }

    MSemaphore gate(0, 0);
    gate.Init(0);
    MThread heldUp;
    heldUp.Create(answerWhenLetGo, &gate, 0, 0, 0, nullptr);
    int* answer = nullptr;
    // Timeouts have a grain of whole seconds: this waits up to one second.
    std::printf("\nWait 200 ms for a thread that is held up: %d (time ran out)\n", heldUp.Wait(&answer, nullptr, 200));
    gate.Signal();
    const int status = heldUp.Wait(&answer, nullptr, 5000);
    std::printf("let go, then Wait: %d, it answered %d\n", status, answer != nullptr ? *answer : -1);
    return 0;
}
