// The int, double, bool and rope accessors.
#include <cfloat>

#include <gtest/gtest.h>

#include "tessaline/config/rvConfig.h"

namespace {

TEST(RvConfigTyped, NumbersFromText)
{
    rvConfig config;
    EXPECT_EQ(config.GetValue("n", 5, ""), 5);
    EXPECT_EQ(config.GetValue("n", 2.5, ""), 2.5);
    const struct {
        const char* text;
        int number;
        double real;
    } rows[] = {
        {"abc", 0, 0.0},
        {"", 0, 0.0},
        {"12abc", 12, 12.0},
        {" 42", 42, 42.0},
        {"0x10", 0, 16.0},
        {"1e3", 1, 1e3},
        {"99999999999", 2147483647, 99999999999.0},
        {"-99999999999", -2147483647 - 1, -99999999999.0},
    };
    for (const auto& row : rows) {
        config.PutValue("n", row.text, "");
        EXPECT_EQ(config.GetValue("n", 5, ""), row.number) << row.text;
        EXPECT_EQ(config.GetValue("n", 2.5, ""), row.real) << row.text;
    }
    config.PutValue("n", -7, "");
    EXPECT_STREQ(config.GetValue("n", "", ""), "-7");
    config.PutValue("d", 1.5, "");
    EXPECT_STREQ(config.GetValue("d", "", ""), "1.500000");
    EXPECT_EQ(config.GetValue("d", 0, ""), 1);
    config.PutValue("d", 0.0000001, "");
    EXPECT_STREQ(config.GetValue("d", "", ""), "0.000000");
    // Too long for "%f" in 32 bytes: a form that fits and reads back.
    config.PutValue("d", -1e300, "");
    EXPECT_STREQ(config.GetValue("d", "", ""), "-1.0000000000000001e+300");
    config.PutValue("d", -DBL_MAX, "");
    EXPECT_EQ(config.GetValue("d", 0.0, ""), -DBL_MAX);
}

TEST(RvConfigTyped, BoolsAreWholeWords)
{
    rvConfig config;
    EXPECT_EQ(config.GetBool("b", 7, ""), 7u);
    config.PutBool("b", 2, "");
    EXPECT_STREQ(config.GetValue("b", "", ""), "True");
    EXPECT_EQ(config.GetValue("b", 5, ""), 0);
    config.PutBool("b", 0, "");
    EXPECT_STREQ(config.GetValue("b", "", ""), "False");
    const struct {
        const char* text;
        unsigned int value;
    } rows[] = {{"True", 1}, {"tRuE", 1}, {"1", 1},  {"FALSE", 0}, {"0", 0}, {"maybe", 7},
                {"", 7},     {"yes", 7},  {"00", 7}, {" true", 7}, {"2", 7}};
    for (const auto& row : rows) {
        config.PutValue("b", row.text, "");
        EXPECT_EQ(config.GetBool("b", 7, ""), row.value) << row.text;
    }
}

TEST(RvConfigTyped, RopesShareText)
{
    rvConfig config;
    const __gnu_cxx::crope value("shared value");
    config.PutValue(__gnu_cxx::crope("k"), value, __gnu_cxx::crope("s"));
    __gnu_cxx::crope out;
    config.GetValue(out, __gnu_cxx::crope("K"), __gnu_cxx::crope("def"), __gnu_cxx::crope("S"));
    EXPECT_EQ(rvConfig::cfgStr(out).c_str(), rvConfig::cfgStr(value).c_str());
    config.GetValue(out, "missing", "def", "s");
    EXPECT_EQ(out, __gnu_cxx::crope("def"));
    config.PutValue("empty", __gnu_cxx::crope(), "s");
    config.GetValue(out, "empty", "def", "s");
    EXPECT_TRUE(out.empty());
}

TEST(RvConfigTyped, GettersTouchNothing)
{
    rvConfig config;
    config.PutValue("k", "v", "s");
    config.IsModified(0);
    __gnu_cxx::crope out;
    for (const char* key : {"k", "missing"}) {
        config.GetValue(key, 1, "s");
        config.GetValue(key, 1.0, "s");
        config.GetBool(key, 1, "s");
        config.GetValue(out, key, "d", "s");
        config.GetValue(key, "d", "nosuch");
    }
    EXPECT_EQ(config.IsModified(), 0u);
    EXPECT_EQ(config.IsValid(), 2u);
    EXPECT_EQ(config.SectionCnt(), 2u);
    EXPECT_STREQ(config.Section(), "defaults");
}

}  // namespace
