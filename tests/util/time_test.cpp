#include <climits>
#include <cstdlib>
#include <ctime>
#include <string>

#include <gtest/gtest.h>

#include "tessaline/util/rvTime.h"

namespace {

// Every test that depends on the zone sets it first.
void useZone(const char* zone)
{
    setenv("TZ", zone, 1);
    tzset();
}

// One hour west of Greenwich, with summer time from the last Sunday of March
// to the last Sunday of October.
constexpr const char* kOneHourWest = "XST1XDT,M3.5.0,M10.5.0";

// 2021-01-15 and 2021-07-15, 12:00:00, as seconds of a clock.
constexpr long kWinterNoon = 1610712000;
constexpr long kSummerNoon = 1626350400;

}  // namespace

TEST(RvTime, FromSecondsAndCalendarFields)
{
    useZone(kOneHourWest);
    EXPECT_EQ(kWinterNoon, rvTime(kWinterNoon, true).m_time);
    EXPECT_EQ(kWinterNoon + 3600, rvTime(kWinterNoon, false).m_time);
    EXPECT_EQ(kSummerNoon, rvTime(kSummerNoon, false).m_time);

    EXPECT_EQ(kWinterNoon + 3600, rvTime(2021, 1, 15, 12, 0, 0, 0).m_time);
    EXPECT_EQ(kSummerNoon, rvTime(2021, 7, 15, 12, 0, 0, 1).m_time);
    EXPECT_EQ(kSummerNoon, rvTime(2021, 7, 15, 12, 0, 0, -1).m_time);
    // Out-of-range fields roll over: month 13 is January of the next year.
    EXPECT_EQ(rvTime(2022, 1, 15, 12, 0, 0, 0), rvTime(2021, 13, 15, 12, 0, 0, 0));
    EXPECT_EQ(rvTimeSpan(-5), rvTime(10, true) - rvTime(15, true));

    const time_t before = std::time(nullptr);
    const rvTime now = rvTime::GetCurrentTime();
    EXPECT_GE(now.m_time, before);
    EXPECT_LE(now.m_time, std::time(nullptr));
}

TEST(RvTime, FromDosWords)
{
    useZone("UTC0");
    EXPECT_EQ(315532800, rvTime(static_cast<unsigned short>(0x0021), static_cast<unsigned short>(0), -1).m_time);
    // 2021-07-15 (41 years, month 7, day 15), 23:59:58 (seconds field 29).
    const unsigned short date = (41 << 9) | (7 << 5) | 15;
    const unsigned short time = (23 << 11) | (59 << 5) | 29;
    char out[32];
    EXPECT_STREQ("2021-07-15 23:59:58", rvTime(date, time, 0).FormatGmt("%Y-%m-%d %H:%M:%S", out, sizeof out));
}

TEST(RvTime, BreakDownAndFormat)
{
    useZone(kOneHourWest);
    const rvTime epoch(0, true);
    char out[32];
    EXPECT_STREQ("1970-01-01 00:00:00", epoch.FormatGmt("%Y-%m-%d %H:%M:%S", out, sizeof out));
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
    EXPECT_EQ(23, shared->tm_hour);

    const rvTime far(LONG_MAX, true);
    if (sizeof(time_t) > 4) {
        // A 64-bit time_t reaches instants too far out to break down.
        EXPECT_EQ(nullptr, far.GetGmtTm(&fields));
        EXPECT_EQ(nullptr, far.GetLocalTm(nullptr));
        EXPECT_STREQ("", far.Format("%Y", out, sizeof out));
    } else {
        // A 32-bit time_t (32-bit x86) ends early in 2038; every instant breaks down.
        EXPECT_STREQ("2038-01-19 03:14:07", far.FormatGmt("%Y-%m-%d %H:%M:%S", out, sizeof out));
    }
}

TEST(RvTimeSpan, Format)
{
    auto text = [](time_t seconds, const char* format) {
        char out[128];
        return std::string(rvTimeSpan(seconds).Format(format, out, 0));
    };
    EXPECT_EQ("1 01:01:01", text(86400 + 3600 + 60 + 1, "%D %H:%M:%S"));
    EXPECT_EQ("0 -1:-1:-1", text(-3661, "%D %H:%M:%S"));
    EXPECT_EQ("-1 -1:-1:-1", text(-(86400 + 3661), "%D %H:%M:%S"));
    // The widest span differs: time_t is 64 bits on x86-64, 32 on 32-bit x86.
    const time_t days = sizeof(time_t) > 4 ? time_t{100000000} : time_t{24855};
    EXPECT_EQ(std::to_string(days), text(days * 86400, "%D"));
    EXPECT_EQ("100%", text(0, "100%%"));
    EXPECT_EQ("d h x", text(90061, "%d %h %x"));
    EXPECT_EQ("ends here ", text(1, "ends here %"));
    EXPECT_EQ("", text(1, "%"));
    EXPECT_EQ("", text(1, nullptr));
    EXPECT_EQ(nullptr, rvTimeSpan(1).Format("%S", nullptr, 0));
}

TEST(RvTimeSpan, Overlap)
{
    auto overlap = [](time_t a1, time_t a2, time_t b1, time_t b2) {
        rvTimeSpan span(99);
        span.Overlap(rvTime(a1, true), rvTime(a2, true), rvTime(b1, true), rvTime(b2, true));
        return span.GetTimeSpan();
    };
    EXPECT_EQ(5, overlap(10, 20, 15, 30));  // a starts first, b runs past its end
    EXPECT_EQ(5, overlap(15, 30, 10, 20));  // b starts first
    EXPECT_EQ(2, overlap(10, 20, 12, 14));  // b inside a
    EXPECT_EQ(2, overlap(12, 14, 10, 20));  // a inside b
    EXPECT_EQ(0, overlap(10, 20, 25, 30));  // a ends before b starts
    EXPECT_EQ(0, overlap(25, 30, 10, 20));  // a starts after b ends
    EXPECT_EQ(0, overlap(10, 20, 10, 5));   // equal starts: a's rule, which sees b end first
}
