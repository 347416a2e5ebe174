// MThread: the routine's cooperative, cancellable pause.
#include <cstdint>
#include <ctime>

#include "thread/relaxed.h"
#include "tessaline/thread/MThread.h"
#include "tessaline/util/rvTime.h"

using tessaline::loadRelaxed;

namespace {

constexpr int kPauseCancelled = -6;
constexpr uint32_t kMicrosecondsPerSecond = 1000000;
constexpr uint32_t kMicrosecondsPerMillisecond = 1000;
// A slice is at most this plus the part of the remaining time below one
// second, so the flag and the cancellation point are tested at least every
// six seconds.
constexpr uint32_t kSliceWholeSeconds = 5;

uint32_t ticks()
{
    return static_cast<uint32_t>(_gettickcount());
}

void sleepMicroseconds(uint32_t microseconds)
{
    timespec length{};
    length.tv_sec = microseconds / kMicrosecondsPerSecond;
    length.tv_nsec = static_cast<long>(microseconds % kMicrosecondsPerSecond) * 1000;
    nanosleep(&length, nullptr);
}

}  // namespace

int MThread::Cancelled(int* /*err*/, int milliseconds)
{
    pthread_testcancel();
    // A negative length would wrap into a long pause near the counter's start.
    if (loadRelaxed(m_cancelled) != 0 || milliseconds <= 0) {
        return loadRelaxed(m_cancelled);
    }
    // The tick counter is 32 bits wide; so is this arithmetic, wrap included.
    const uint32_t end = ticks() + static_cast<uint32_t>(milliseconds) * kMicrosecondsPerMillisecond;
    for (uint32_t now = ticks(); loadRelaxed(m_cancelled) == 0 && now < end; now = ticks()) {
        const uint32_t remaining = end - now;
        const uint32_t longest = kSliceWholeSeconds * kMicrosecondsPerSecond + remaining % kMicrosecondsPerSecond;
        sleepMicroseconds(remaining < longest ? remaining : longest);
        pthread_testcancel();
    }
    return loadRelaxed(m_cancelled);
}

int MThread::Pause(int* err, int milliseconds)
{
    return Cancelled(err, milliseconds) != 0 ? kPauseCancelled : 0;
}
