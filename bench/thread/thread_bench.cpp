// Thread classes against the standard library and raw POSIX threads: the
// cost of an uncontended lock and unlock, of a condition-variable round trip
// between two threads, and of starting and joining a thread.
//
// Groups (see common/bench_names.h):
//   thread_mutex_plain/<impl>/uncontended, thread_mutex_recursive/<impl>/uncontended
//   thread_condvar_pingpong/<impl>/round_trip
//   thread_create_join/<impl>/empty_routine
#include <condition_variable>
#include <mutex>
#include <thread>

#include <pthread.h>

#include <benchmark/benchmark.h>

#include "common/bench_names.h"
#include "tessaline/tessaline.h"

namespace {

template <typename Mutex>
void LockUnlock(benchmark::State& state, Mutex& mutex)
{
    for (auto _ : state) {
        mutex.Lock(nullptr);
        mutex.Unlock(nullptr);
    }
}

void MMutexBench(benchmark::State& state, MMutex_::MutexType type)
{
    MMutex mutex(type);
    LockUnlock(state, mutex);
}

template <typename StdMutex>
void StdMutexBench(benchmark::State& state)
{
    StdMutex mutex;
    for (auto _ : state) {
        mutex.lock();
        mutex.unlock();
    }
}

void PthreadMutexBench(benchmark::State& state, int type)
{
    pthread_mutexattr_t attr;
    pthread_mutexattr_init(&attr);
    pthread_mutexattr_settype(&attr, type);
    pthread_mutex_t mutex;
    pthread_mutex_init(&mutex, &attr);
    for (auto _ : state) {
        pthread_mutex_lock(&mutex);
        pthread_mutex_unlock(&mutex);
    }
    pthread_mutex_destroy(&mutex);
    pthread_mutexattr_destroy(&attr);
}

// One iteration: hand the turn to the other thread and wait until it hands
// it back.
void MCondVarPingPong(benchmark::State& state)
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

void StdConditionVariablePingPong(benchmark::State& state)
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

void* Nothing(void*)
{
    return nullptr;
}

// timeout -1 is the straight join; 0 goes through the timed machinery first:
// the condition wait on m_finished, then the join.
void MThreadCreateWait(benchmark::State& state, long timeout)
{
    for (auto _ : state) {
        MThread thread;
        thread.Create(Nothing, nullptr, 0, 0, 0, nullptr);
        thread.Wait(nullptr, nullptr, timeout);
    }
}

void StdThreadCreateJoin(benchmark::State& state)
{
    for (auto _ : state) {
        std::thread thread([] {});
        thread.join();
    }
}

void PthreadCreateJoin(benchmark::State& state)
{
    for (auto _ : state) {
        pthread_t thread;
        pthread_create(&thread, nullptr, Nothing, nullptr);
        pthread_join(thread, nullptr);
    }
}

[[maybe_unused]] const bool registered = [] {
    const char* uncontended = "uncontended";
    bench::Register("thread_mutex_plain", "tessaline", uncontended, MMutexBench, MMutex_::MutexPlain);
    bench::Register("thread_mutex_plain", "std_mutex", uncontended, StdMutexBench<std::mutex>);
    bench::Register("thread_mutex_plain", "pthread", uncontended, PthreadMutexBench, int{PTHREAD_MUTEX_DEFAULT});
    bench::Register("thread_mutex_recursive", "tessaline", uncontended, MMutexBench, MMutex_::MutexRecursive);
    bench::Register("thread_mutex_recursive", "std_recursive_mutex", uncontended, StdMutexBench<std::recursive_mutex>);
    bench::Register("thread_mutex_recursive", "pthread", uncontended, PthreadMutexBench, int{PTHREAD_MUTEX_RECURSIVE});
    bench::Register("thread_mutex_checked", "tessaline", uncontended, MMutexBench, MMutex_::MutexChecked);
    bench::Register("thread_mutex_checked", "pthread_errorcheck", uncontended, PthreadMutexBench,
                    int{PTHREAD_MUTEX_ERRORCHECK});
    bench::Register("thread_condvar_pingpong", "tessaline", "round_trip", MCondVarPingPong)
        ->UseRealTime()
        ->Unit(benchmark::kMicrosecond);
    bench::Register("thread_condvar_pingpong", "std_condition_variable", "round_trip", StdConditionVariablePingPong)
        ->UseRealTime()
        ->Unit(benchmark::kMicrosecond);
    bench::Register("thread_create_join", "tessaline", "empty_routine", MThreadCreateWait, -1L)
        ->UseRealTime()
        ->Unit(benchmark::kMicrosecond);
    bench::Register("thread_create_join", "tessaline_timed_wait", "empty_routine", MThreadCreateWait, 0L)
        ->UseRealTime()
        ->Unit(benchmark::kMicrosecond);
    bench::Register("thread_create_join", "std_thread", "empty_routine", StdThreadCreateJoin)
        ->UseRealTime()
        ->Unit(benchmark::kMicrosecond);
    bench::Register("thread_create_join", "pthread", "empty_routine", PthreadCreateJoin)
        ->UseRealTime()
        ->Unit(benchmark::kMicrosecond);
    return true;
}();

}  // namespace
