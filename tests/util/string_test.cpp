#include <cstring>

#include <gtest/gtest.h>

#include "tessaline/util/rvString.h"

TEST(CaseCompare, IgnoresCaseAndOrdersNullFirst)
{
    EXPECT_EQ(0, _stricmp("Section", "sECTION"));
    EXPECT_LT(_stricmp("alpha", "BETA"), 0);
    EXPECT_GT(_stricmp("gamma", "BETA"), 0);
    EXPECT_EQ(0, _strnicmp("KeyName", "keyword", 3));
    EXPECT_NE(0, _strnicmp("KeyName", "keyword", 4));

    EXPECT_EQ(0, _stricmp(nullptr, nullptr));
    EXPECT_LT(_stricmp(nullptr, ""), 0);
    EXPECT_GT(_strnicmp("a", nullptr, 1), 0);
    EXPECT_EQ(0, _strnicmp("a", nullptr, 0));
}

TEST(CaseConvert, ConvertsInPlace)
{
    char text[] = "Mixed Case 42!";
    EXPECT_EQ(text, _strlwr(text));
    EXPECT_STREQ("mixed case 42!", text);
    EXPECT_EQ(text, _strupr(text));
    EXPECT_STREQ("MIXED CASE 42!", text);
    EXPECT_EQ(nullptr, _strlwr(nullptr));
}

TEST(CaseConvert, HighBytesFollowTheLocale)
{
    // A byte above 127 must not be a negative ctype index; in the C locale
    // it stays as it is.
    char text[] = "A\xc4\xff";
    _strlwr(text);
    EXPECT_STREQ("a\xc4\xff", text);
    _strupr(text);
    EXPECT_STREQ("A\xc4\xff", text);
}

TEST(LowerTable, LowersOnlyAsciiLetters)
{
    EXPECT_EQ('a', rv_lowerTable[int('A')]);
    EXPECT_EQ('z', rv_lowerTable[int('Z')]);
    EXPECT_EQ('@', rv_lowerTable[int('@')]);
    EXPECT_EQ('[', rv_lowerTable[int('[')]);
    EXPECT_EQ(0xc4, rv_lowerTable[0xc4]);
}

TEST(SearchFirst, FindsTheFirstMatchInAnyCase)
{
    char text[] = "The QUICK fox, the quick dog";
    EXPECT_EQ(text + 4, _strstri(text, "quick"));
    EXPECT_EQ(text, _strstri(text, "tHE"));
    EXPECT_EQ(text + 25, _strstri(text, "DOG"));
    EXPECT_EQ(nullptr, _strstri(text, "cat"));
    EXPECT_EQ(nullptr, _strstri(text, "dogs"));
    EXPECT_EQ(nullptr, _strstri(text, ""));
    EXPECT_EQ(nullptr, _strstri(nullptr, "x"));
    EXPECT_EQ(nullptr, _strstri(text, nullptr));
}

TEST(SearchLast, IgnoresMatchesThatTouchTheEnd)
{
    char dotted[] = "a.b.c";
    EXPECT_EQ(dotted + 1, _strrstri(dotted, ".B"));
    EXPECT_EQ(nullptr, _strrstri(dotted, ".c"));
    EXPECT_EQ(dotted + 3, _strrstri(dotted, "."));

    char repeated[] = "xAbxabx";
    EXPECT_EQ(repeated + 4, _strrstri(repeated, "AB"));

    char same[] = "name";
    EXPECT_EQ(nullptr, _strrstri(same, "NAME"));
    EXPECT_EQ(nullptr, _strrstri(same, "longer than name"));
    EXPECT_EQ(nullptr, _strrstri(same, ""));
    EXPECT_EQ(nullptr, _strrstri(nullptr, "n"));
    EXPECT_EQ(nullptr, _strrstri(same, nullptr));
}

TEST(SafeCopy, TruncatesAndLeavesTheTailAlone)
{
    {
        char dest[8] = "#######";
        rv_safe_strcpy(dest, "sixchr", 4);
        EXPECT_EQ(0, std::memcmp(dest, "six\0###", 8));
    }
    {
        char dest[8] = "#######";
        void* end = rv_safe_strcpy(dest, "x", 4);
        EXPECT_EQ(0, std::memcmp(dest, "x\0#\0###", 8));
        EXPECT_EQ(dest + 2, end);
    }
    {
        char dest[4] = "###";
        EXPECT_EQ(nullptr, rv_safe_strcpy(dest, "abc", 0));
        EXPECT_STREQ("", dest);
    }
    {
        char dest[4] = "###";
        rv_safe_strcpy(dest, nullptr, 4);
        EXPECT_EQ(0, std::memcmp(dest, "\0##", 4));
    }
    EXPECT_EQ(nullptr, rv_safe_strcpy(nullptr, "abc", 4));
}
