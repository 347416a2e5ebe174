// The microsecond counter behind thread timeouts.
#include <atomic>
#include <cstdint>
#include <ctime>

#include <sys/time.h>

#include "tessaline/util/rvTime.h"

namespace tessaline::util {
namespace {

constexpr std::uint64_t kTicksPerSecond = 1000000;

// The start time in microseconds since the epoch, 0 until the first call.
// One atomic word keeps seconds and microseconds of the start together;
// threads racing through the first call agree on whichever stored first.
std::atomic<std::uint64_t> g_startTicks{0};

std::uint64_t TicksOf(const timeval& tv)
{
    return static_cast<std::uint64_t>(tv.tv_sec) * kTicksPerSecond + static_cast<std::uint64_t>(tv.tv_usec);
}

}  // namespace
}  // namespace tessaline::util

using tessaline::util::g_startTicks;
using tessaline::util::kTicksPerSecond;
using tessaline::util::TicksOf;

unsigned long _gettickcount()
{
    timeval now;
    const bool haveNow = gettimeofday(&now, nullptr) == 0;
    std::uint64_t start = g_startTicks.load(std::memory_order_relaxed);
    if (start == 0) {
        const std::uint64_t first =
            haveNow ? TicksOf(now) : static_cast<std::uint64_t>(std::time(nullptr)) * kTicksPerSecond;
        g_startTicks.compare_exchange_strong(start, first, std::memory_order_relaxed);
        return 0;
    }
    if (!haveNow) {
        return 0;
    }
    return static_cast<std::uint32_t>(TicksOf(now) - start);
}
