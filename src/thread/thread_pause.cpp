// MThread: the routine's cooperative, cancellable pause.
#include <cstdint>
#include <ctime>

#include "thread/guard_lock.h"
#include "thread/relaxed.h"
#include "tessaline/thread/MThread.h"
#include "tessaline/util/rvTime.h"

namespace tessaline::thread {
namespace {

constexpr int kPauseCancelled = -6;
constexpr uint32_t kMicrosecondsPerSecond = 1000000;
constexpr uint32_t kMicrosecondsPerMillisecond = 1000;
constexpr long kNanosecondsPerSecond = 1000000000;
// A slice is at most this plus the part of the remaining time below one
// second, so the flag and the cancellation point are tested at least every
// six seconds.
constexpr uint32_t kSliceWholeSeconds = 5;

uint32_t Ticks()
{
    return static_cast<uint32_t>(_gettickcount());
}

// Sleeps in a timed wait on a condition that nobody signals. Like nanosleep
// it is a cancellation point; unlike a cancelled nanosleep, a cancelled
// condition wait is understood by the race detectors, which would otherwise
// lose track of the thread's clean-up handler and its locks.
class SliceSleeper {
public:
    SliceSleeper()
    {
        pthread_condattr_t attr;
        pthread_condattr_init(&attr);
        pthread_condattr_setclock(&attr, CLOCK_MONOTONIC);
        pthread_cond_init(&m_cond, &attr);
        pthread_condattr_destroy(&attr);
        pthread_mutex_init(&m_mutex, nullptr);
    }
    ~SliceSleeper()
    {
        pthread_cond_destroy(&m_cond);
        pthread_mutex_destroy(&m_mutex);
    }
    SliceSleeper(const SliceSleeper&) = delete;
    SliceSleeper& operator=(const SliceSleeper&) = delete;

    void Sleep(uint32_t microseconds)
    {
        timespec until{};
        clock_gettime(CLOCK_MONOTONIC, &until);
        const long nanoseconds = until.tv_nsec + static_cast<long>(microseconds % kMicrosecondsPerSecond) * 1000;
        until.tv_sec += microseconds / kMicrosecondsPerSecond + nanoseconds / kNanosecondsPerSecond;
        until.tv_nsec = nanoseconds % kNanosecondsPerSecond;
        // A cancelled wait takes the mutex back before it unwinds; the guard
        // releases it on the way out.
        PlatformMutex mutex(m_mutex);
        GuardLock lock(mutex);
        while (pthread_cond_timedwait(&m_cond, &m_mutex, &until) == 0) {
        }
    }

private:
    pthread_cond_t m_cond;
    pthread_mutex_t m_mutex;
};

}  // namespace
}  // namespace tessaline::thread

using tessaline::thread::kMicrosecondsPerMillisecond;
using tessaline::thread::kMicrosecondsPerSecond;
using tessaline::thread::kPauseCancelled;
using tessaline::thread::kSliceWholeSeconds;
using tessaline::thread::LoadRelaxed;
using tessaline::thread::SliceSleeper;
using tessaline::thread::Ticks;

int MThread::Cancelled(int* /*err*/, int milliseconds)
{
    pthread_testcancel();
    // A negative length would wrap into a long pause near the counter's start.
    if (LoadRelaxed(m_cancelled) != 0 || milliseconds <= 0) {
        return LoadRelaxed(m_cancelled);
    }
    // The tick counter is 32 bits wide; so is this arithmetic, wrap included.
    const uint32_t end = Ticks() + static_cast<uint32_t>(milliseconds) * kMicrosecondsPerMillisecond;
    SliceSleeper sleeper;
    for (uint32_t now = Ticks(); LoadRelaxed(m_cancelled) == 0 && now < end; now = Ticks()) {
        const uint32_t remaining = end - now;
        const uint32_t longest = kSliceWholeSeconds * kMicrosecondsPerSecond + remaining % kMicrosecondsPerSecond;
        sleeper.Sleep(remaining < longest ? remaining : longest);
        pthread_testcancel();
    }
    return LoadRelaxed(m_cancelled);
}

int MThread::Pause(int* err, int milliseconds)
{
    return Cancelled(err, milliseconds) != 0 ? kPauseCancelled : 0;
}
