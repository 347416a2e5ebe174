// Text, keywords and time: the small helpers a host reaches for when it
// parses commands and reports durations.
#include <cstdio>
#include <initializer_list>

#include "tessaline/util/HashToken.h"
#include "tessaline/util/rvString.h"
#include "tessaline/util/rvTime.h"

namespace {

enum Command { kStatus = 1, kStart, kStop, kStopAll };

// Sorted by name (ignoring case), so that a loose lookup finds the longest
// name that begins the word.
_tokenHash g_commands[] = {{"start", kStart}, {"status", kStatus}, {"stop", kStop}, {"stopall", kStopAll}};
constexpr int kLastRow = sizeof g_commands / sizeof g_commands[0] - 1;

}  // namespace

int main()
{
    std::printf("== Strings ==\n");
    char header[] = "Content-Type: TEXT/Plain; charset=UTF-8";
    std::printf("_stricmp(\"Content-Type\", \"content-type\") = %d\n", _stricmp("Content-Type", "content-type"));
    std::printf("_strnicmp(header, \"CONTENT-\", 8) = %d\n", _strnicmp(header, "CONTENT-", 8));
    std::printf("_strstri(header, \"text/plain\") -> \"%s\"\n", _strstri(header, "text/plain"));
    std::printf("_strlwr(header) -> \"%s\"\n", _strlwr(header));

    char name[8];
    rv_safe_strcpy(name, "a-long-host-name", sizeof name);
    std::printf("rv_safe_strcpy into 8 bytes -> \"%s\"\n", name);

    char digits[72];
    std::printf("rv_itoa(493, 2) = %s\n", rv_itoa(493, digits, 2));
    std::printf("rv_itoa(493, 8) = %s\n", rv_itoa(493, digits, 8));
    std::printf("rv_itoa(-2, 16) = %s\n", rv_itoa(-2, digits, 16));
    std::printf("_ui64toa(2^64 - 1, 36) = %s\n", _ui64toa(18446744073709551615ull, digits, 36));
    std::printf("_atoi64(\"-9,876,543,210\") = %lld\n", _atoi64("-9,876,543,210"));

    std::printf("\n== Keywords ==\n");
    for (const char* word : {"STATUS", "Stop", "stopall", "restart"}) {
        std::printf("exact \"%s\" -> %d\n", word, HashToken(word, g_commands, kLastRow, 0, 1));
    }
    for (const char* word : {"stopall-now", "stop-web", "start:db", "st"}) {
        std::printf("loose \"%s\" -> %d\n", word, HashToken(word, g_commands, kLastRow, 0, 0));
    }

    std::printf("\n== Time ==\n");
    // Fixed instants in UTC: the output does not depend on the clock or on
    // the local time zone.
    const rvTime started(1700000000L, true);
    const rvTime finished(1700236800L, true);
    char text[64];
    std::printf("started   %s\n", started.FormatGmt("%Y-%m-%d %H:%M:%S UTC", text, sizeof text));
    std::printf("finished  %s\n", finished.FormatGmt("%A, %d %B %Y, %H:%M", text, sizeof text));

    const rvTimeSpan took = finished - started;
    std::printf("took      %s (%lld seconds)\n", took.Format("%D days %H:%M:%S", text, sizeof text),
                static_cast<long long>(took.GetTimeSpan()));
    std::printf("backwards %s\n", (started - finished).Format("%D days %H h %M min", text, sizeof text));

    // How much of the run fell into a maintenance window.
    rvTimeSpan overlap;
    overlap.Overlap(started, finished, rvTime(1700200000L, true), rvTime(1700300000L, true));
    std::printf("overlap   %s of the window\n", overlap.Format("%H:%M:%S", text, sizeof text));

    std::printf("in order  %s\n", started < finished ? "yes" : "no");
    return 0;
}
