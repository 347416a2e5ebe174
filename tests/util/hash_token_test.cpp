#include <gtest/gtest.h>

#include "tessaline/util/HashToken.h"

namespace {

// The same rows as the library's own URL scheme table.
_tokenHash g_schemes[] = {{"file", 0}, {"ftp", 1}, {"http", 2}};

// Sorted, with names that are prefixes of the next ones.
_tokenHash g_nested[] = {{"a", 10}, {"ab", 11}, {"abc", 12}, {"b", 20}, {"ba", 21}};

}  // namespace

TEST(HashToken, ExactSearch)
{
    EXPECT_EQ(1, HashToken("FTP", g_schemes, 2, 0, 1));
    EXPECT_EQ(2, HashToken("http", g_schemes, 2, 0, 1));
    EXPECT_EQ(0, HashToken("File", g_schemes, 2, 0, 1));
    EXPECT_EQ(-1, HashToken("https", g_schemes, 2, 0, 1));
    EXPECT_EQ(-1, HashToken("ht", g_schemes, 2, 0, 1));
    EXPECT_EQ(-1, HashToken("", g_schemes, 2, 0, 1));

    _tokenHash duplicates[] = {{"x", 1}, {"X", 2}, {"y", 3}};
    EXPECT_EQ(1, HashToken("x", duplicates, 2, 0, 1));
    EXPECT_EQ(2, HashToken("x", duplicates, 2, 1, 1));
}

TEST(HashToken, LooseSearchTakesTheLongestPrefix)
{
    EXPECT_EQ(2, HashToken("https", g_schemes, 2, 0, 0));
    EXPECT_EQ(0, HashToken("FILES", g_schemes, 2, 0, 0));
    EXPECT_EQ(1, HashToken("ftp://host", g_schemes, 2, 0, 0));
    EXPECT_EQ(-1, HashToken("ht", g_schemes, 2, 0, 0));
    EXPECT_EQ(-1, HashToken("gopher", g_schemes, 2, 0, 0));

    EXPECT_EQ(12, HashToken("abcd", g_nested, 4, 0, 0));
    EXPECT_EQ(11, HashToken("AB", g_nested, 4, 0, 0));
    EXPECT_EQ(10, HashToken("a", g_nested, 4, 0, 0));
    EXPECT_EQ(10, HashToken("ax", g_nested, 4, 0, 0));
    EXPECT_EQ(21, HashToken("bat", g_nested, 4, 0, 0));
    EXPECT_EQ(-1, HashToken("c", g_nested, 4, 0, 0));

    _tokenHash withEmpty[] = {{"", 5}, {"x", 6}};
    EXPECT_EQ(5, HashToken("anything", withEmpty, 1, 0, 0));
    EXPECT_EQ(6, HashToken("xyz", withEmpty, 1, 0, 0));
}

TEST(HashToken, RangeLimitsBothModes)
{
    EXPECT_EQ(-1, HashToken("file", g_schemes, 2, 1, 1));
    EXPECT_EQ(-1, HashToken("files", g_schemes, 2, 1, 0));
    EXPECT_EQ(-1, HashToken("http", g_schemes, 1, 0, 1));
    EXPECT_EQ(-1, HashToken("https", g_schemes, 1, 0, 0));
    EXPECT_EQ(11, HashToken("abcd", g_nested, 1, 0, 0));
    EXPECT_EQ(12, HashToken("abcd", g_nested, 4, 2, 0));

    // A range of one row.
    EXPECT_EQ(1, HashToken("ftp", g_schemes, 1, 1, 1));
    EXPECT_EQ(1, HashToken("ftps", g_schemes, 1, 1, 0));
    EXPECT_EQ(-1, HashToken("http", g_schemes, 1, 1, 1));
}

TEST(HashToken, BadArgumentsGiveMinusOne)
{
    EXPECT_EQ(-1, HashToken(nullptr, g_schemes, 2, 0, 1));
    EXPECT_EQ(-1, HashToken("ftp", nullptr, 2, 0, 0));
    EXPECT_EQ(-1, HashToken("ftp", g_schemes, 2, -1, 1));
    EXPECT_EQ(-1, HashToken("ftp", g_schemes, 0, 1, 1));
    EXPECT_EQ(-1, HashToken("ftp", g_schemes, 0, 1, 0));
}

TEST(HashToken, UnsortedLooseSearchStaysInRange)
{
    _tokenHash unsorted[] = {{"zeta", 1}, {"alpha", 2}, {"al", 3}, {"mu", 4}, {"a", 5}};
    for (const char* token : {"alphabet", "zetas", "mu"}) {
        const int value = HashToken(token, unsorted, 4, 0, 0);
        EXPECT_TRUE(value == -1 || (value >= 1 && value <= 5)) << token;
    }
}
