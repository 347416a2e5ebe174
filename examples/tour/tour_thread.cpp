#include <cstdio>

#include "tessaline/tessaline.h"
#include "tour.h"

namespace {

// Waits for the go-ahead, then adds up 1 to 10.
void* AddUp(void* goAhead)
{
    static int sum = 0;
    static_cast<MSemaphore*>(goAhead)->Wait();
    for (int i = 1; i <= 10; ++i) {
        sum += i;
    }
    return &sum;
}

struct Sleeper {
    MThread thread;
    MSemaphore started{0, 0};
};

// Pauses for a minute, unless cancelled first.
void* PauseAMinute(void* arg)
{
    auto& sleeper = *static_cast<Sleeper*>(arg);
    sleeper.started.Signal();
    std::printf("sleeper: this line is never reached, Pause gave %d\n", sleeper.thread.Pause(nullptr, 60000));
    return nullptr;
}

}  // namespace

void TourThread()
{
    std::printf("\n== Threads ==\n");
    MMutex mutex(MMutex_::MutexRecursive);
    int first = mutex.Lock(nullptr);
    int second = mutex.Lock(nullptr);
    std::printf("recursive mutex locked twice: %d %d (holder count %d)\n", first, second, mutex.m_count);
    first = mutex.Unlock(nullptr);
    second = mutex.Unlock(nullptr);
    int third = mutex.Unlock(nullptr);
    std::printf("unlocked twice: %d %d; a third Unlock is refused with %d\n", first, second, third);

    MSemaphore goAhead(0, 0);
    goAhead.Init(0);
    MThread adder(MThread_::PriorityNormal);
    std::printf("adder started: %d\n", adder.Create(AddUp, &goAhead, 0, 0, 0, nullptr));
    int* sum = nullptr;
    std::printf("Wait for 1 ms while it waits for the go-ahead: %d (time ran out)\n", adder.Wait(&sum, nullptr, 1));
    goAhead.Signal();
    int status = adder.Wait(&sum, nullptr, -1);
    std::printf("after the go-ahead, Wait joins it: %d, its result %d\n", status, *sum);

    Sleeper sleeper;
    sleeper.started.Init(0);
    std::printf("sleeper started: %d\n", sleeper.thread.Create(PauseAMinute, &sleeper, 0, 0, 0, nullptr));
    sleeper.started.Wait();
    std::printf("thread objects alive: %d\n", __atomic_load_n(&MThread_::m_threadCnt, __ATOMIC_RELAXED));
    sleeper.thread.Cancel();
    // A cancelled thread detaches itself: Wait sees it detached (3) or, if
    // it was quicker, no thread left to wait for (-1).
    status = sleeper.thread.Wait(nullptr, nullptr, 0);
    std::printf("Cancel during its Pause, then Wait: %s; cancelled %d, detached %s, exists %s\n",
                status == 3 || status == -1 ? "it went away" : "unexpected", sleeper.thread.m_cancelled,
                sleeper.thread.m_state == 3 ? "yes" : "no", sleeper.thread.Exists() ? "yes" : "no");
}
