// The int, double, bool and rope accessors.
#include <cfloat>
#include <string>

#include <gtest/gtest.h>

#include "tessaline/config/rvConfig.h"

namespace {

TEST(RvConfigTyped, IntegersFromText)
{
    rvConfig config;
    EXPECT_EQ(config.GetValue("n", 5, ""), 5);
    const struct {
        const char* text;
        int value;
    } rows[] = {
        {"abc", 0},       {"", 0},        {"12abc", 12},          {" 42", 42},
        {"0x10", 0},      {"1e3", 1},     {"-7", -7},             {"99999999999", 2147483647},
        {"-99999999999", -2147483647 - 1}, {"2147483647", 2147483647},
    };
    for (const auto& row : rows) {
        config.PutValue("n", row.text, "");
        EXPECT_EQ(config.GetValue("n", 5, ""), row.value) << row.text;
    }
    config.PutValue("n", -7, "");
    EXPECT_STREQ(config.GetValue("n", "", ""), "-7");
}

TEST(RvConfigTyped, DoublesKeepSixDecimals)
{
    rvConfig config;
    EXPECT_EQ(config.GetValue("d", 2.5, ""), 2.5);
    config.PutValue("d", "abc", "");
    EXPECT_EQ(config.GetValue("d", 2.5, ""), 0.0);
    config.PutValue("d", "1e3", "");
    EXPECT_EQ(config.GetValue("d", 2.5, ""), 1000.0);

    config.PutValue("d", 1.5, "");
    EXPECT_STREQ(config.GetValue("d", "", ""), "1.500000");
    EXPECT_EQ(config.GetValue("d", 0.0, ""), 1.5);
    EXPECT_EQ(config.GetValue("d", 0, ""), 1);
    config.PutValue("d", 0.0000001, "");
    EXPECT_STREQ(config.GetValue("d", "", ""), "0.000000");

    // Too long for "%f" in 32 bytes: the exponent form, which reads back.
    config.PutValue("d", -1e300, "");
    EXPECT_STREQ(config.GetValue("d", "", ""), "-1.0000000000000001e+300");
    EXPECT_EQ(config.GetValue("d", 0.0, ""), -1e300);
    config.PutValue("d", 1e23, "");
    EXPECT_STREQ(config.GetValue("d", "", ""), "99999999999999991611392.000000");
    config.PutValue("d", -DBL_MAX, "");
    EXPECT_EQ(config.GetValue("d", 0.0, ""), -DBL_MAX);
}

TEST(RvConfigTyped, BoolsAreWholeWords)
{
    rvConfig config;
    EXPECT_EQ(config.GetBool("b", 7, ""), 7u);
    config.PutBool("b", 2, "");
    EXPECT_STREQ(config.GetValue("b", "", ""), "True");
    EXPECT_EQ(config.GetBool("b", 0, ""), 1u);
    EXPECT_EQ(config.GetValue("b", 5, ""), 0);
    config.PutBool("b", 0, "");
    EXPECT_STREQ(config.GetValue("b", "", ""), "False");

    const struct {
        const char* text;
        unsigned int value;
    } rows[] = {
        {"TRUE", 1}, {"tRuE", 1}, {"1", 1},     {"FALSE", 0},  {"0", 0},  {"maybe", 7},
        {"", 7},     {"yes", 7},  {"00", 7},    {" true", 7},  {"2", 7},
    };
    for (const auto& row : rows) {
        config.PutValue("b", row.text, "");
        EXPECT_EQ(config.GetBool("b", 7, ""), row.value) << row.text;
    }
}

TEST(RvConfigTyped, RopesShareText)
{
    rvConfig config;
    const __gnu_cxx::crope key("k");
    const __gnu_cxx::crope section("s");
    __gnu_cxx::crope value("shared value");
    config.PutValue(key, value, section);
    __gnu_cxx::crope out;
    config.GetValue(out, __gnu_cxx::crope("K"), __gnu_cxx::crope("def"), __gnu_cxx::crope("S"));
    EXPECT_EQ(out, value);
    EXPECT_EQ(rvConfig::cfgStr(out).c_str(), rvConfig::cfgStr(value).c_str());

    config.GetValue(out, "missing", "def", "s");
    EXPECT_EQ(out, __gnu_cxx::crope("def"));
    config.PutValue("empty", __gnu_cxx::crope(), "s");
    config.GetValue(out, "empty", "def", "s");
    EXPECT_TRUE(out.empty());
    config.Section("s", 0);
    config.GetValue(out, __gnu_cxx::crope("k"), __gnu_cxx::crope("def"), __gnu_cxx::crope());
    EXPECT_EQ(out, value);
}

TEST(RvConfigTyped, GettersTouchNothing)
{
    rvConfig config;
    config.PutValue("k", "v", "s");
    config.IsModified(0);
    const unsigned int items = config.IsValid();
    __gnu_cxx::crope out;
    for (const char* key : {"k", "missing"}) {
        config.GetValue(key, 1, "s");
        config.GetValue(key, 1.0, "s");
        config.GetBool(key, 1, "s");
        config.GetValue(out, key, "d", "s");
        config.GetValue(key, "d", "nosuch");
    }
    EXPECT_EQ(config.IsModified(), 0u);
    EXPECT_EQ(config.IsValid(), items);
    EXPECT_EQ(config.SectionCnt(), 2u);
    EXPECT_STREQ(config.Section(), "defaults");
}

}  // namespace
