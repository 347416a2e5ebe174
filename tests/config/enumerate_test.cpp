// Enumeration in table order, counts, and removal.
#include <gtest/gtest.h>

#include "tessaline/config/rvConfig.h"

namespace {

TEST(RvConfigEnumerate, Sections)
{
    rvConfig config;
    EXPECT_STREQ(config.EnumSections(0), nullptr);  // no start yet
    EXPECT_STREQ(config.EnumSections(1), "defaults");
    EXPECT_EQ(config.EnumSections(0), nullptr);
    EXPECT_EQ(config.EnumSections(0), nullptr);
    config.Clear();
    EXPECT_EQ(config.EnumSections(1), nullptr);
}

TEST(RvConfigEnumerate, TokensRestartAfterTheEnd)
{
    rvConfig config;
    EXPECT_EQ(config.EnumTokens("defaults", 1), nullptr);
    EXPECT_EQ(config.TokenCnt("defaults"), 0u);
    config.PutValue("y", "1", "s");
    config.PutValue("x", "1", "s");
    EXPECT_STREQ(config.EnumTokens("S", 1), "x");
    EXPECT_STREQ(config.EnumTokens("s", 0), "y");
    EXPECT_EQ(config.EnumTokens("s", 0), nullptr);
    EXPECT_STREQ(config.EnumTokens("s", 0), "x");
    EXPECT_EQ(config.EnumTokens("nosuch", 1), nullptr);
    EXPECT_EQ(config.TokenCnt("nosuch"), 0u);
    EXPECT_EQ(config.TokenCnt("S"), 2u);
    // One cursor per object: going on under another section's name moves it.
    config.PutValue("k", "1", "t");
    EXPECT_STREQ(config.EnumTokens("s", 1), "x");
    EXPECT_STREQ(config.EnumTokens("t", 0), "y");
    // The current section does not stand in for "".
    config.Section("s", 0);
    EXPECT_EQ(config.TokenCnt(""), 0u);
    EXPECT_EQ(config.EnumTokens("", 1), nullptr);
}

TEST(RvConfigRemove, KeysAndSections)
{
    rvConfig config;
    config.PutValue("k", "1", "s");
    config.PutValue("j", "2", "s");
    config.Section("s", 0);
    config.IsModified(0);
    const unsigned int items = config.IsValid();

    config.RemoveKey("nosuch", "k");
    EXPECT_EQ(config.IsModified(), 1u);
    config.RemoveKey("S", "K");
    config.RemoveKey("s", "j");
    EXPECT_EQ(config.TokenCnt("s"), 0u);
    EXPECT_EQ(config.SectionCnt(), 2u);
    EXPECT_EQ(config.IsValid(), items);

    config.PutValue("k", "1", "");
    config.RemoveSection("S");
    EXPECT_EQ(config.SectionCnt(), 1u);
    EXPECT_STREQ(config.Section(), "s");
    EXPECT_EQ(config.GetValue("k", static_cast<const char*>(nullptr), ""), nullptr);
    config.PutValue("k", "2", "");
    EXPECT_STREQ(config.GetValue("k", "d", "s"), "2");

    config.RemoveSection("defaults");
    EXPECT_EQ(config.TokenCnt("defaults"), 0u);
    EXPECT_STREQ(config.DefaultSection(), "defaults");
    config.IsModified(0);
    config.RemoveSection("nosuch");
    EXPECT_EQ(config.IsModified(), 1u);
}

}  // namespace
