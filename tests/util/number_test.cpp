#include <climits>
#include <cstring>
#include <string>

#include <gtest/gtest.h>

#include "tessaline/util/rvString.h"

TEST(NumberToText, Radixes)
{
    char out[72];
    EXPECT_EQ(out, rv_itoa(0, out, 2));
    EXPECT_STREQ("0", out);
    EXPECT_STREQ("-255", rv_itoa(-255, out, 10));
    EXPECT_STREQ("zz", rv_itoa(36 * 36 - 1, out, 36));
    EXPECT_STREQ("1111011", rv_itoa(123, out, 2));
    EXPECT_STREQ("-2147483648", rv_itoa(INT_MIN, out, 10));
    EXPECT_STREQ("ff", rv_ltoa(255, out, 16));
    EXPECT_STREQ("4294967295", rv_ultoa(4294967295UL, out, 10));
}

TEST(NumberToText, NegativeOutsideRadixTenIsTheBitPattern)
{
    char out[72];
    // An int converts as 32 bits, a long as 64 bits on this platform.
    EXPECT_STREQ("ffffffff", rv_itoa(-1, out, 16));
    EXPECT_STREQ("37777777777", rv_itoa(-1, out, 8));
    EXPECT_STREQ("ffffffffffffffff", rv_ltoa(-1, out, 16));
    EXPECT_STREQ("ffffffffffffff00", _i64toa(-256, out, 16));
    EXPECT_EQ(std::string(64, '1'), rv_ultoa(ULONG_MAX, out, 2));
}

TEST(NumberToText, SixtyFourBitLimits)
{
    char out[72];
    EXPECT_STREQ("-9223372036854775808", _i64toa(LLONG_MIN, out, 10));
    EXPECT_STREQ("9223372036854775807", _i64toa(LLONG_MAX, out, 10));
    EXPECT_STREQ("18446744073709551615", _ui64toa(ULLONG_MAX, out, 10));
    EXPECT_STREQ("3w5e11264sgsf", _ui64toa(ULLONG_MAX, out, 36));
    EXPECT_STREQ("-9223372036854775808", rv_ltoa(LONG_MIN, out, 10));
}

TEST(NumberToText, RadixOutsideTwoToThirtySixWritesNothing)
{
    char out[72];
    for (int radix : {-10, 0, 1, 37, 100}) {
        std::strcpy(out, "old");
        EXPECT_EQ(out, rv_itoa(-42, out, radix));
        EXPECT_STREQ("", out) << radix;
        EXPECT_STREQ("", rv_ltoa(42, out, radix));
        EXPECT_STREQ("", rv_ultoa(42, out, radix));
        EXPECT_STREQ("", _i64toa(42, out, radix));
        EXPECT_STREQ("", _ui64toa(42, out, radix));
    }
    EXPECT_EQ(nullptr, rv_itoa(1, nullptr, 10));
}

TEST(TextToNumber, SkipsNonDigitsAndHonoursALeadingMinus)
{
    EXPECT_EQ(-12, _atoi64("-12"));
    EXPECT_EQ(12, _atoi64("1-2"));
    EXPECT_EQ(12, _atoi64("+12"));
    EXPECT_EQ(0, _atoi64(""));
    EXPECT_EQ(7, _atoi64("  7"));
    EXPECT_EQ(123, _atoi64("12a3"));
    EXPECT_EQ(0, _atoi64(nullptr));
    EXPECT_EQ(5u, _atoui64("-5"));
    EXPECT_EQ(1234u, _atoui64("1,234"));
    EXPECT_EQ(0u, _atoui64(nullptr));
}

TEST(TextToNumber, StopsBeforeTheDigitThatOverflows)
{
    EXPECT_EQ(LLONG_MAX, _atoi64("9223372036854775807"));
    EXPECT_EQ(-LLONG_MAX, _atoi64("-9223372036854775807"));
    EXPECT_EQ(922337203685477580LL, _atoi64("9223372036854775808"));
    EXPECT_EQ(-922337203685477580LL, _atoi64("-9223372036854775808"));
    EXPECT_EQ(922337203685477580LL, _atoi64("92233720368547758089"));

    EXPECT_EQ(ULLONG_MAX, _atoui64("18446744073709551615"));
    EXPECT_EQ(1844674407370955161ULL, _atoui64("18446744073709551616"));
    EXPECT_EQ(1844674407370955161ULL, _atoui64("184467440737095516160"));
}
