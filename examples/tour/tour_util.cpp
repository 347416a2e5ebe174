#include <cstdio>
#include <initializer_list>

#include "tessaline/tessaline.h"
#include "tour.h"

namespace {

// Sorted by name, so that loose lookup finds the longest matching prefix.
_tokenHash g_commands[] = {{"get", 1}, {"getall", 2}, {"put", 3}, {"quit", 4}};
constexpr int kLastCommand = 3;

}  // namespace

void TourUtil()
{
    std::printf("\n== Text, numbers and time ==\n");

    char line[] = "Server=Alpha; PORT=8080";
    std::printf("_strstri(\"%s\", \"port\") finds \"%s\"\n", line, _strstri(line, "port"));
    std::printf("_strupr gives \"%s\"\n", _strupr(line));

    char number[72];
    std::printf("rv_itoa(255, 16) = %s, rv_itoa(-1, 16) = %s, _i64toa(-42, 10) = %s\n", rv_itoa(255, number, 16),
                rv_itoa(-1, number + 24, 16), _i64toa(-42, number + 48, 10));
    std::printf("_atoi64(\"-1,234,567\") = %lld\n", _atoi64("-1,234,567"));

    for (const char* word : {"GETALL", "get", "Put", "list"}) {
        std::printf("exact token \"%s\" -> %d\n", word, HashToken(word, g_commands, kLastCommand, 0, 1));
    }
    for (const char* word : {"getall-now", "quitting", "pu"}) {
        std::printf("loose token \"%s\" -> %d\n", word, HashToken(word, g_commands, kLastCommand, 0, 0));
    }

    const rvTime start(2024, 3, 1, 8, 30, 0, -1);
    const rvTime end(2024, 3, 3, 17, 45, 20, -1);
    char text[64];
    std::printf("from %s", start.Format("%Y-%m-%d %H:%M:%S", text, sizeof text));
    std::printf(" to %s: ", end.Format("%Y-%m-%d %H:%M:%S", text, sizeof text));
    std::printf("%s\n", (end - start).Format("%D days %H:%M:%S", text, 0));

    rvTimeSpan overlap;
    overlap.Overlap(start, end, rvTime(2024, 3, 3, 12, 0, 0, -1), rvTime(2024, 3, 4, 12, 0, 0, -1));
    std::printf("overlap with noon of the 3rd to noon of the 4th: %s\n", overlap.Format("%H h %M min %S s", text, 0));
}
