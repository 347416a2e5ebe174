#include <climits>
#include <cstring>
#include <string>

#include <gtest/gtest.h>

#include "tessaline/util/rvString.h"

TEST(NumberToText, RadixesLimitsAndBitPatterns)
{
    char out[72];
    EXPECT_EQ(out, rv_itoa(0, out, 2));
    EXPECT_STREQ("0", out);
    EXPECT_STREQ("-255", rv_itoa(-255, out, 10));
    EXPECT_STREQ("zz", rv_itoa(36 * 36 - 1, out, 36));
    EXPECT_STREQ("-2147483648", rv_itoa(INT_MIN, out, 10));
    EXPECT_STREQ("-9223372036854775808", _i64toa(LLONG_MIN, out, 10));
    EXPECT_STREQ("18446744073709551615", _ui64toa(ULLONG_MAX, out, 10));

    // A long converts at its own width: 64 bits on x86-64, 32 on 32-bit x86.
    const bool longIs64 = sizeof(long) == 8;
    EXPECT_STREQ(longIs64 ? "-9223372036854775808" : "-2147483648", rv_ltoa(LONG_MIN, out, 10));

    // Outside radix 10 a negative value is its bit pattern: 32 bits for an
    // int, the width of long for a long.
    EXPECT_STREQ("ffffffff", rv_itoa(-1, out, 16));
    EXPECT_STREQ("37777777777", rv_itoa(-1, out, 8));
    EXPECT_STREQ(longIs64 ? "ffffffffffffffff" : "ffffffff", rv_ltoa(-1, out, 16));
    EXPECT_STREQ("ffffffffffffff00", _i64toa(-256, out, 16));
    EXPECT_EQ(std::string(longIs64 ? 64 : 32, '1'), rv_ultoa(ULONG_MAX, out, 2));

    // A radix outside 2 to 36 writes nothing.
    for (int radix : {-10, 0, 1, 37}) {
        std::strcpy(out, "old");
        EXPECT_STREQ("", rv_itoa(-42, out, radix)) << radix;
        EXPECT_STREQ("", _ui64toa(42, out, radix));
    }
    EXPECT_EQ(nullptr, rv_itoa(1, nullptr, 10));
}

TEST(TextToNumber, SkipsNonDigitsAndStopsBeforeOverflow)
{
    EXPECT_EQ(-12, _atoi64("-12"));
    EXPECT_EQ(12, _atoi64("1-2"));
    EXPECT_EQ(123, _atoi64("12a3"));
    EXPECT_EQ(0, _atoi64(nullptr));
    EXPECT_EQ(5u, _atoui64("-5"));
    EXPECT_EQ(0u, _atoui64(nullptr));

    // The digit that would overflow ends the scan; later digits are not read.
    EXPECT_EQ(LLONG_MAX, _atoi64("9223372036854775807"));
    EXPECT_EQ(-922337203685477580LL, _atoi64("-9223372036854775808"));
    EXPECT_EQ(922337203685477580LL, _atoi64("92233720368547758089"));
    EXPECT_EQ(ULLONG_MAX, _atoui64("18446744073709551615"));
    EXPECT_EQ(1844674407370955161ULL, _atoui64("184467440737095516160"));
}
