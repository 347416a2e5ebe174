#include <climits>
#include <cstdlib>
#include <ctime>
#include <string>

#include <gtest/gtest.h>

#include "tessaline/util/rvTime.h"

namespace {

// Sets the process's time zone for one test and restores it afterwards.
class ScopedTimeZone {
public:
    explicit ScopedTimeZone(const char* zone)
    {
        const char* old = std::getenv("TZ");
        m_hadOld = old != nullptr;
        if (m_hadOld) {
            m_old = old;
        }
        setenv("TZ", zone, 1);
        tzset();
    }

    ~ScopedTimeZone()
    {
        if (m_hadOld) {
            setenv("TZ", m_old.c_str(), 1);
        } else {
            unsetenv("TZ");
        }
        tzset();
    }

    ScopedTimeZone(const ScopedTimeZone&) = delete;
    ScopedTimeZone& operator=(const ScopedTimeZone&) = delete;

private:
    bool m_hadOld = false;
    std::string m_old;
};

// One hour west of Greenwich, with summer time from the last Sunday of March
// to the last Sunday of October.
constexpr const char* kOneHourWest = "XST1XDT,M3.5.0,M10.5.0";

// 2021-01-15 and 2021-07-15, 12:00:00, as seconds of a clock.
constexpr long kWinterNoon = 1610712000;
constexpr long kSummerNoon = 1626350400;

std::string spanText(time_t seconds, const char* format)
{
    char out[128];
    return rvTimeSpan(seconds).Format(format, out, 0);
}

rvTime at(time_t seconds)
{
    return rvTime(seconds, true);
}

}  // namespace

TEST(RvTime, FromSeconds)
{
    EXPECT_EQ(0, rvTime(0, true).m_time);
    EXPECT_EQ(kWinterNoon, rvTime(kWinterNoon, true).GetTime());

    ScopedTimeZone zone(kOneHourWest);
    EXPECT_EQ(kWinterNoon + 3600, rvTime(kWinterNoon, false).m_time);
    EXPECT_EQ(kSummerNoon, rvTime(kSummerNoon, false).m_time);
}

TEST(RvTime, FromCalendarFields)
{
    ScopedTimeZone zone(kOneHourWest);
    EXPECT_EQ(kWinterNoon + 3600, rvTime(2021, 1, 15, 12, 0, 0, 0).m_time);
    EXPECT_EQ(kSummerNoon, rvTime(2021, 7, 15, 12, 0, 0, 1).m_time);
    EXPECT_EQ(kSummerNoon, rvTime(2021, 7, 15, 12, 0, 0, -1).m_time);
    // Out-of-range fields roll over: month 13 is January of the next year.
    EXPECT_EQ(rvTime(2022, 1, 15, 12, 0, 0, 0), rvTime(2021, 13, 15, 12, 0, 0, 0));
}

TEST(RvTime, FromDosWords)
{
    ScopedTimeZone zone("UTC0");
    {
        const rvTime start(static_cast<unsigned short>(0x0021), static_cast<unsigned short>(0), -1);
        tm fields;
        ASSERT_EQ(&fields, start.GetLocalTm(&fields));
        EXPECT_EQ(80, fields.tm_year);
        EXPECT_EQ(0, fields.tm_mon);
        EXPECT_EQ(1, fields.tm_mday);
        EXPECT_EQ(0, fields.tm_hour);
        EXPECT_EQ(315532800, start.m_time);
    }
    {
        // 2021-07-15 (41 years, month 7, day 15), 23:59:58 (seconds field 29).
        const unsigned short date = (41 << 9) | (7 << 5) | 15;
        const unsigned short time = (23 << 11) | (59 << 5) | 29;
        char out[32];
        EXPECT_STREQ("2021-07-15 23:59:58",
                     rvTime(date, time, 0).FormatGmt("%Y-%m-%d %H:%M:%S", out, sizeof out));
    }
}

TEST(RvTime, BreakDownAndFormat)
{
    ScopedTimeZone zone(kOneHourWest);
    const rvTime epoch(0, true);
    char out[32];
    EXPECT_EQ(out, epoch.FormatGmt("%Y-%m-%d %H:%M:%S", out, sizeof out));
    EXPECT_STREQ("1970-01-01 00:00:00", out);
    EXPECT_STREQ("1969-12-31 23:00:00 XST", epoch.Format("%Y-%m-%d %H:%M:%S %Z", out, sizeof out));

    // The result must fit with its NUL, or nothing is left.
    EXPECT_STREQ("", epoch.FormatGmt("%Y-%m-%d", out, 10));
    EXPECT_STREQ("1970-01-01", epoch.FormatGmt("%Y-%m-%d", out, 11));
    EXPECT_STREQ("", epoch.FormatGmt(nullptr, out, sizeof out));
    EXPECT_EQ(nullptr, epoch.FormatGmt("%Y", nullptr, 8));

    tm fields;
    EXPECT_EQ(&fields, epoch.GetGmtTm(&fields));
    EXPECT_EQ(70, fields.tm_year);
    const tm* shared = epoch.GetLocalTm(nullptr);
    ASSERT_NE(nullptr, shared);
    EXPECT_EQ(69, shared->tm_year);
    EXPECT_EQ(23, shared->tm_hour);

    // An instant too far out to break down.
    const rvTime far(LONG_MAX, true);
    EXPECT_EQ(nullptr, far.GetGmtTm(&fields));
    EXPECT_EQ(nullptr, far.GetLocalTm(nullptr));
    std::snprintf(out, sizeof out, "old");
    EXPECT_STREQ("", far.Format("%Y", out, sizeof out));
}

TEST(RvTime, CurrentTimeAndOperators)
{
    const time_t before = std::time(nullptr);
    const rvTime now = rvTime::GetCurrentTime();
    EXPECT_GE(now.m_time, before);
    EXPECT_LE(now.m_time, std::time(nullptr));

    EXPECT_TRUE(at(1) < at(2));
    EXPECT_TRUE(at(2) >= at(2));
    EXPECT_TRUE(at(1) != at(2));
    EXPECT_EQ(rvTimeSpan(-5), at(10) - at(15));
}

TEST(RvTimeSpan, FormatsDaysHoursMinutesSeconds)
{
    EXPECT_EQ("1 01:01:01", spanText(86400 + 3600 + 60 + 1, "%D %H:%M:%S"));
    EXPECT_EQ("00 59", spanText(59, "%M %S"));
    EXPECT_EQ("3 days, 00h", spanText(3 * 86400, "%D days, %Hh"));
    EXPECT_EQ("0 -1:-1:-1", spanText(-3661, "%D %H:%M:%S"));
    EXPECT_EQ("-1 -1:-1:-1", spanText(-(86400 + 3661), "%D %H:%M:%S"));
    EXPECT_EQ("-59", spanText(-59, "%S"));
    EXPECT_EQ("100000000", spanText(100000000L * 86400, "%D"));
}

TEST(RvTimeSpan, PercentRules)
{
    EXPECT_EQ("100%", spanText(0, "100%%"));
    EXPECT_EQ("d h x", spanText(90061, "%d %h %x"));
    EXPECT_EQ("ends here ", spanText(1, "ends here %"));
    EXPECT_EQ("", spanText(1, "%"));
    EXPECT_EQ("", spanText(1, ""));
    EXPECT_EQ("", spanText(1, nullptr));
    EXPECT_EQ(nullptr, rvTimeSpan(1).Format("%S", nullptr, 0));
}

TEST(RvTimeSpan, Overlap)
{
    struct Case {
        time_t a1, a2, b1, b2, expected;
    };
    const Case cases[] = {
        {10, 20, 15, 30, 5},   // a starts first, b runs past its end
        {10, 20, 20, 30, 0},   // they touch
        {10, 20, 25, 30, 0},   // a ends before b starts
        {10, 20, 12, 14, 2},   // b inside a
        {15, 30, 10, 20, 5},   // b starts first
        {12, 14, 10, 20, 2},   // a inside b
        {25, 30, 10, 20, 0},   // a starts after b ends
        {10, 20, 10, 20, 10},  // the same interval
    };
    for (const Case& c : cases) {
        rvTimeSpan span(99);
        span.Overlap(at(c.a1), at(c.a2), at(c.b1), at(c.b2));
        EXPECT_EQ(c.expected, span.GetTimeSpan()) << c.a1 << ".." << c.a2 << " with " << c.b1 << ".." << c.b2;
    }
}
