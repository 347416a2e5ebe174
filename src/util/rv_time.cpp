// Instants: construction from local seconds, calendar fields and DOS words;
// breaking down and formatting.
#include <ctime>

#include "tessaline/util/rvTime.h"

namespace tessaline::util {
namespace {

constexpr long kSecondsPerHour = 3600;

// Adds without the undefined behaviour of a signed overflow: an instant
// near the limits of time_t wraps instead.
time_t WrappingAdd(time_t a, long b)
{
    return static_cast<time_t>(static_cast<unsigned long>(a) + static_cast<unsigned long>(b));
}

time_t FromFields(int year, int month, int day, int hour, int minute, int second, int isDst)
{
    tm fields = {};
    fields.tm_year = year - 1900;
    fields.tm_mon = month - 1;
    fields.tm_mday = day;
    fields.tm_hour = hour;
    fields.tm_min = minute;
    fields.tm_sec = second;
    fields.tm_isdst = isDst;
    return mktime(&fields);
}

char* FormatInto(const tm* fields, const char* format, char* out, int size)
{
    if (out == nullptr || size < 1) {
        return out;
    }
    if (fields == nullptr || format == nullptr || strftime(out, static_cast<size_t>(size), format, fields) == 0) {
        out[0] = '\0';
    }
    return out;
}

}  // namespace
}  // namespace tessaline::util

using tessaline::util::FormatInto;
using tessaline::util::FromFields;
using tessaline::util::kSecondsPerHour;
using tessaline::util::WrappingAdd;

rvTime::rvTime(long value, bool isGmt) : m_time(value)
{
    if (isGmt) {
        return;
    }
    m_time = WrappingAdd(value, timezone);
    const time_t local = value;
    tm fields;
    if (localtime_r(&local, &fields) != nullptr && fields.tm_isdst > 0) {
        m_time = WrappingAdd(m_time, -kSecondsPerHour);
    }
}

rvTime::rvTime(int year, int month, int day, int hour, int minute, int second, int isDst)
    : m_time(FromFields(year, month, day, hour, minute, second, isDst))
{
}

rvTime::rvTime(unsigned short dosDate, unsigned short dosTime, int isDst)
    : m_time(FromFields(1980 + ((dosDate >> 9) & 0x7f), (dosDate >> 5) & 0x0f, dosDate & 0x1f, (dosTime >> 11) & 0x1f,
                        (dosTime >> 5) & 0x3f, 2 * (dosTime & 0x1f), isDst))
{
}

rvTime(rvTime::GetCurrentTime)()
{
    return rvTime(time(nullptr), true);
}

tm* rvTime::GetGmtTm(tm* out) const
{
    return out == nullptr ? gmtime(&m_time) : gmtime_r(&m_time, out);
}

tm* rvTime::GetLocalTm(tm* out) const
{
    return out == nullptr ? localtime(&m_time) : localtime_r(&m_time, out);
}

char* rvTime::Format(const char* format, char* out, int size) const
{
    tm fields;
    return FormatInto(localtime_r(&m_time, &fields), format, out, size);
}

char* rvTime::FormatGmt(const char* format, char* out, int size) const
{
    tm fields;
    return FormatInto(gmtime_r(&m_time, &fields), format, out, size);
}
