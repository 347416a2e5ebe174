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

TEST(CaseConvert, ConvertsInPlaceAndLeavesHighBytes)
{
    // A byte above 127 must not become a negative ctype index; the C locale
    // leaves it as it is.
    char text[] = "Mixed \xc4\xff 42!";
    EXPECT_EQ(text, _strlwr(text));
    EXPECT_STREQ("mixed \xc4\xff 42!", text);
    EXPECT_EQ(text, _strupr(text));
    EXPECT_STREQ("MIXED \xc4\xff 42!", text);
    EXPECT_EQ(nullptr, _strlwr(nullptr));

    for (int c = 0; c < 256; ++c) {
        EXPECT_EQ(c >= 'A' && c <= 'Z' ? c + 32 : c, rv_lowerTable[c]) << c;
    }
}

TEST(Search, FirstMatchAnywhereLastMatchNotTouchingTheEnd)
{
    char text[] = "The QUICK fox, the quick dog";
    EXPECT_EQ(text, _strstri(text, "tHE"));
    EXPECT_EQ(text + 25, _strstri(text, "DOG"));
    EXPECT_EQ(nullptr, _strstri(text, "dogs"));

    char dotted[] = "a.b.c";
    EXPECT_EQ(dotted + 1, _strrstri(dotted, ".B"));
    EXPECT_EQ(dotted + 3, _strrstri(dotted, "."));
    EXPECT_EQ(nullptr, _strrstri(dotted, ".c"));
    EXPECT_EQ(nullptr, _strrstri(dotted, "a.b.c"));
    EXPECT_EQ(nullptr, _strrstri(dotted, "longer than the text"));

    for (auto search : {_strstri, _strrstri}) {
        EXPECT_EQ(nullptr, search(text, ""));
        EXPECT_EQ(nullptr, search(nullptr, "x"));
        EXPECT_EQ(nullptr, search(text, nullptr));
    }
}

TEST(SafeCopy, TruncatesAndLeavesTheTailAlone)
{
    char dest[8] = "#######";
    rv_safe_strcpy(dest, "sixchr", 4);
    EXPECT_EQ(0, std::memcmp(dest, "six\0###", 8));
    EXPECT_EQ(nullptr, rv_safe_strcpy(dest, "abc", 0));
    EXPECT_EQ(0, std::memcmp(dest, "\0ix\0###", 8));
    EXPECT_EQ(dest + 2, rv_safe_strcpy(dest, "x", 4));
    EXPECT_EQ(0, std::memcmp(dest, "x\0x\0###", 8));
    rv_safe_strcpy(dest, nullptr, 4);
    EXPECT_EQ(0, std::memcmp(dest, "\0\0x\0###", 8));
    EXPECT_EQ(nullptr, rv_safe_strcpy(nullptr, "abc", 4));
}
