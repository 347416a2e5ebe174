// Spans: formatting by days, hours, minutes and seconds, and overlap.
#include <algorithm>
#include <cstdio>

#include "tessaline/util/rvTime.h"

namespace tessaline::util {
namespace {

constexpr long kSecondsPerMinute = 60;
constexpr long kSecondsPerHour = 3600;
constexpr long kSecondsPerDay = 86400;

// The difference without the undefined behaviour of a signed overflow.
time_t WrappingDifference(time_t later, time_t earlier)
{
    return static_cast<time_t>(static_cast<unsigned long>(later) - static_cast<unsigned long>(earlier));
}

}  // namespace
}  // namespace tessaline::util

using tessaline::util::kSecondsPerDay;
using tessaline::util::kSecondsPerHour;
using tessaline::util::kSecondsPerMinute;
using tessaline::util::WrappingDifference;

char* rvTimeSpan::Format(const char* format, char* out, int) const
{
    if (out == nullptr) {
        return nullptr;
    }
    const long span = m_timeSpan;
    char* p = out;
    for (const char* f = format; f != nullptr && *f != '\0'; ++f) {
        if (*f != '%') {
            *p++ = *f;
            continue;
        }
        ++f;
        switch (*f) {
        case '\0':
            *p = '\0';
            return out;
        case 'D':
            p += std::sprintf(p, "%ld", span / kSecondsPerDay);
            break;
        case 'H':
            p += std::sprintf(p, "%02ld", span / kSecondsPerHour - 24 * (span / kSecondsPerDay));
            break;
        case 'M':
            p += std::sprintf(p, "%02ld", span / kSecondsPerMinute - 60 * (span / kSecondsPerHour));
            break;
        case 'S':
            p += std::sprintf(p, "%02ld", span % kSecondsPerMinute);
            break;
        default:
            *p++ = *f;
            break;
        }
    }
    *p = '\0';
    return out;
}

void rvTimeSpan::Overlap(const rvTime& a1, const rvTime& a2, const rvTime& b1, const rvTime& b2)
{
    const time_t firstEnd = std::min(a2.m_time, b2.m_time);
    if (a1.m_time >= b1.m_time) {
        m_timeSpan = a1.m_time > b2.m_time ? 0 : WrappingDifference(firstEnd, a1.m_time);
    } else {
        m_timeSpan = a2.m_time < b1.m_time ? 0 : WrappingDifference(firstEnd, b1.m_time);
    }
}
