/**
 * @file
 * @brief Time values: instants, spans and a microsecond counter.
 *
 * rvTime is an instant in seconds since 1 January 1970 00:00:00 UTC;
 * rvTimeSpan a signed length of time in seconds; _gettickcount a microsecond
 * counter for measuring intervals.
 *
 * Both classes hold one number, have no virtual operations and are copied
 * freely by value. Their seconds are time_t, which is 64 bits wide on x86-64
 * Linux (32 on the original 32-bit target), so instants after 2038 and spans
 * beyond 68 years are representable.
 *
 * Thread safety: objects share no state. The local-time operations follow
 * the process's time zone (TZ, taken in by tzset()); GetGmtTm and GetLocalTm
 * with a null `out` return the C library's static structure, which is good
 * only until the next gmtime/localtime call in any thread. _gettickcount may
 * be called from any thread, the first call included.
 */
#ifndef TESSALINE_UTIL_RVTIME_H
#define TESSALINE_UTIL_RVTIME_H

#include <time.h>

#include "tessaline/export.h"

class rvTimeSpan;

/**
 * An instant: seconds since 1 January 1970 00:00:00 UTC, in one time_t.
 * Compared and subtracted by value; the difference of two instants is an
 * rvTimeSpan. See rvTime.h for thread safety.
 */
class TESSALINE_API rvTime {
public:
    /// With `isGmt` true, `value` is seconds since the epoch. Otherwise it
    /// counts seconds by the local clock and is brought to UTC: the global
    /// `timezone` (seconds west of Greenwich) is added, and 3600 subtracted
    /// if localtime of `value` is in summer time. `timezone` is read before
    /// anything sets it, so call tzset() (or any local-time function) once
    /// before the first local conversion in a process.
    rvTime(long value, bool isGmt);

    /// From calendar fields by mktime in the local zone: `year` in full
    /// (1999), `month` from 1; `isDst` goes into tm_isdst (positive summer
    /// time, 0 none, negative the platform decides). Out-of-range fields are
    /// normalised; a failure leaves -1 in m_time.
    rvTime(int year, int month, int day, int hour, int minute, int second, int isDst);

    /// From DOS date and time words (day bits 0-4, month 5-8, year since 1980
    /// 9-15; seconds / 2 bits 0-4, minutes 5-10, hours 11-15), as the
    /// calendar-field constructor.
    rvTime(unsigned short dosDate, unsigned short dosTime, int isDst);

    /// The present moment. (The name is parenthesised because windows-style
    /// headers define GetCurrentTime() as a macro.)
    static rvTime(GetCurrentTime)();

    /// m_time broken down by gmtime (GetGmtTm) or localtime (GetLocalTm).
    /// With a null `out` the result is the C library's static structure,
    /// valid until the next such call in any thread; otherwise it is stored
    /// in *out and `out` returned. Null if m_time cannot be broken down.
    ///@{
    tm* GetGmtTm(tm* out) const;
    tm* GetLocalTm(tm* out) const;
    ///@}

    /// strftime of m_time as local (Format) or UTC (FormatGmt) time into
    /// `out`, at most `size` bytes with the NUL. Returns `out`. If m_time
    /// cannot be broken down or the result does not fit, `out` holds the
    /// empty string. A null `format` gives the empty string; a null `out` or
    /// a `size` below 1 writes nothing.
    ///@{
    char* Format(const char* format, char* out, int size) const;
    char* FormatGmt(const char* format, char* out, int size) const;
    ///@}

    /// The seconds since the epoch, m_time.
    time_t GetTime() const { return m_time; }

    /// Comparison of the instants' seconds.
    ///@{
    bool operator==(const rvTime& other) const { return m_time == other.m_time; }
    bool operator!=(const rvTime& other) const { return m_time != other.m_time; }
    bool operator<(const rvTime& other) const { return m_time < other.m_time; }
    bool operator<=(const rvTime& other) const { return m_time <= other.m_time; }
    bool operator>(const rvTime& other) const { return m_time > other.m_time; }
    bool operator>=(const rvTime& other) const { return m_time >= other.m_time; }
    ///@}

    /// The span from `other` to this instant.
    inline rvTimeSpan operator-(const rvTime& other) const;

    /// Seconds since 1 January 1970 00:00:00 UTC; -1 after a failed
    /// conversion.
    time_t m_time;
};

/**
 * A signed length of time in seconds, in one time_t. Made directly, as the
 * difference of two rvTime values, or as the overlap of two intervals. See
 * rvTime.h for thread safety.
 */
class TESSALINE_API rvTimeSpan {
public:
    /// A span of `seconds`, which may be negative.
    explicit rvTimeSpan(time_t seconds = 0) : m_timeSpan(seconds) {}

    /// Writes `format` into `out` with these directives (case-sensitive):
    ///
    /// | Directive | Written                             |
    /// |-----------|-------------------------------------|
    /// | "%D"      | whole days ("%ld")                  |
    /// | "%H"      | hours within the day ("%02ld")      |
    /// | "%M"      | minutes within the hour ("%02ld")   |
    /// | "%S"      | seconds within the minute ("%02ld") |
    ///
    /// A percent sign before any other character writes that character, so
    /// "%%" gives "%"; a lone percent sign at the end of `format` ends the
    /// text there. Divisions truncate towards zero: each part of a negative
    /// span carries its own sign (-3661 seconds give "-1" for each of "%H", "%M"
    /// and "%S"). The `int` is not a limit: `out` must have room for the whole
    /// result. Returns `out`; a null `out` gives null, a null `format` the
    /// empty string.
    char* Format(const char* format, char* out, int) const;

    /// Sets m_timeSpan to the length common to the intervals a1..a2 and
    /// b1..b2, 0 if they don't meet. Each interval must run forwards.
    void Overlap(const rvTime& a1, const rvTime& a2, const rvTime& b1, const rvTime& b2);

    /// The seconds of the span, m_timeSpan.
    time_t GetTimeSpan() const { return m_timeSpan; }

    /// Comparison of the spans' seconds.
    ///@{
    bool operator==(const rvTimeSpan& other) const { return m_timeSpan == other.m_timeSpan; }
    bool operator!=(const rvTimeSpan& other) const { return m_timeSpan != other.m_timeSpan; }
    ///@}

    /// The length in seconds; negative for a span that runs backwards.
    time_t m_timeSpan;
};

inline rvTimeSpan rvTime::operator-(const rvTime& other) const
{
    return rvTimeSpan(m_time - other.m_time);
}

/// Microseconds since the first call in the process, which returns 0. The
/// count follows the wall clock (gettimeofday), so setting the system time
/// shows in it, and it is cut to 32 bits although unsigned long is 64 bits
/// wide here: it wraps to 0 about every 71.6 minutes, and differences of two
/// readings are meant to be taken modulo 2^32. Returns 0 if the clock cannot
/// be read. One system call, no allocation.
TESSALINE_API unsigned long _gettickcount();

#endif
