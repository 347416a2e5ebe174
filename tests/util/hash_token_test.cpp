#include <gtest/gtest.h>

#include "tessaline/util/HashToken.h"

TEST(HashToken, ExactAndLooseSearch)
{
    // The library's own scheme rows, and sorted names that are prefixes of the next ones.
    _tokenHash schemes[] = {{"file", 0}, {"ftp", 1}, {"http", 2}};
    _tokenHash nested[] = {{"a", 10}, {"ab", 11}, {"abc", 12}, {"b", 20}, {"ba", 21}};
    _tokenHash duplicates[] = {{"x", 1}, {"X", 2}, {"y", 3}};
    _tokenHash withEmpty[] = {{"", 5}, {"x", 6}};
    struct Case {
        const char* token;
        _tokenHash* table;
        int high, low, exact, loose;
    };
    const Case cases[] = {
        {"FTP", schemes, 2, 0, 1, 1},
        {"https", schemes, 2, 0, -1, 2},
        {"ht", schemes, 2, 0, -1, -1},
        {"AB", nested, 4, 0, 11, 11},
        {"abcd", nested, 4, 0, -1, 12},  // the longest prefix wins
        {"ax", nested, 4, 0, -1, 10},
        {"bat", nested, 4, 0, -1, 21},  // row `high` is searched
        {"c", nested, 4, 0, -1, -1},
        {"x", duplicates, 2, 0, 1, 2},  // exact: the first; loose: the last
        {"anything", withEmpty, 1, 0, -1, 5},
        // The range limits both searches.
        {"files", schemes, 2, 1, -1, -1},
        {"http", schemes, 1, 0, -1, -1},
        {"abcd", nested, 1, 0, -1, 11},
        {"ftp", schemes, 1, 1, 1, 1},
        // Bad arguments.
        {nullptr, schemes, 2, 0, -1, -1},
        {"ftp", nullptr, 2, 0, -1, -1},
        {"ftp", schemes, 2, -1, -1, -1},
        {"ftp", schemes, 0, 1, -1, -1},
    };
    for (const Case& c : cases) {
        const char* token = c.token ? c.token : "(null)";
        EXPECT_EQ(c.exact, HashToken(c.token, c.table, c.high, c.low, 1)) << token << " " << c.high << c.low;
        EXPECT_EQ(c.loose, HashToken(c.token, c.table, c.high, c.low, 0)) << token << " " << c.high << c.low;
    }
}
