// The table of sections and keys: hashing, bucket order, lookup and store,
// the current and default sections, and the counters.
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "tessaline/config/rvConfig.h"

namespace {

using cfgStr = rvConfig::cfgStr;

std::vector<std::string> sectionsInOrder(rvConfig& config)
{
    std::vector<std::string> names;
    for (const char* name = config.EnumSections(1); name != nullptr; name = config.EnumSections(0)) {
        names.push_back(name);
    }
    return names;
}

std::vector<std::string> keysInOrder(rvConfig& config, const char* section)
{
    std::vector<std::string> names;
    for (const char* name = config.EnumTokens(section, 1); name != nullptr; name = config.EnumTokens(section, 0)) {
        names.push_back(name);
    }
    return names;
}

long indexOf(const std::vector<std::string>& names, const std::string& name)
{
    for (size_t i = 0; i < names.size(); ++i) {
        if (names[i] == name) {
            return static_cast<long>(i);
        }
    }
    return -1;
}

TEST(RvConfigHash, FiveBytesFromTheEndFoldedAndSigned)
{
    const rvConfig::rvstrhashfunction hash;
    const struct {
        const char* name;
        unsigned int value;
    } rows[] = {
        {"defaults", 3515},
        {"DEFAULTS", 3515},
        {"a", 97},
        {"port", 691},
        {"timeout", 691},
        {"abcdefghijklmnopqrstuvwxyz", 4775},
        {"\xE9", 4294967273u},
        {"", 0},
    };
    for (const auto& row : rows) {
        EXPECT_EQ(hash(cfgStr(row.name)), row.value) << row.name;
    }
    EXPECT_EQ(hash(cfgStr("\xE9")) % 193, 85u);
    EXPECT_EQ(hash(cfgStr("\xE9")) % 389, 379u);
    // Only the last five probe positions count: a change elsewhere is free.
    EXPECT_EQ(hash(cfgStr("xbcdefghijklmnopqrstuvwxyz")), 4775u);
    // A rope made of pieces hashes like its flat text.
    __gnu_cxx::crope pieces("abcdefghijklm");
    pieces += __gnu_cxx::crope("nopqrstuvwxyz0123456789-long-enough-to-stay-in-pieces");
    EXPECT_EQ(hash(cfgStr(pieces)), hash(cfgStr(cfgStr(pieces).c_str())));
}

TEST(RvConfigCfgStr, SharesTextAndHoldsNullWhenEmpty)
{
    EXPECT_TRUE(cfgStr("").empty());
    EXPECT_TRUE(cfgStr(nullptr).empty());
    EXPECT_STREQ(cfgStr().c_str(), "");
    char buffer[] = "text";
    const cfgStr copied(buffer);
    buffer[0] = 'n';
    EXPECT_STREQ(copied.c_str(), "text");
    const cfgStr shared(copied);
    EXPECT_EQ(shared.c_str(), copied.c_str());
    EXPECT_TRUE(rvConfig::eqcstr()(cfgStr("Port"), cfgStr("pORT")));
    EXPECT_FALSE(rvConfig::eqcstr()(cfgStr("Port"), cfgStr("Ports")));
}

TEST(RvConfigModel, NewObjectHasTheEmptyDefaultSection)
{
    rvConfig config;
    EXPECT_EQ(config.SectionCnt(), 1u);
    EXPECT_STREQ(config.Section(), "defaults");
    EXPECT_STREQ(config.DefaultSection(), "defaults");
    EXPECT_EQ(config.IsValid(), 1u);
    EXPECT_EQ(config.IsModified(), 0u);
    EXPECT_EQ(config.Mode(), rvConfig::OpenRead);
    EXPECT_STREQ(config.ConfigName(), "");
    EXPECT_EQ(config.m_sections.bucket_count(), 193u);
    EXPECT_EQ(config.m_sections.find(cfgStr("defaults"))->second.bucket_count(), 193u);
}

TEST(RvConfigModel, LookupIgnoresCaseAndKeepsStoredSpelling)
{
    rvConfig config;
    config.PutValue("Port", "1", "Net");
    EXPECT_STREQ(config.GetValue("PORT", "9", "net"), "1");
    config.PutValue("PORT", "2", "net");
    EXPECT_STREQ(config.GetValue("port", "9", "NET"), "2");
    EXPECT_EQ(sectionsInOrder(config), (std::vector<std::string>{"defaults", "Net"}));
    EXPECT_EQ(keysInOrder(config, "net"), std::vector<std::string>{"Port"});
}

TEST(RvConfigModel, LookupSearchesOneSectionOnly)
{
    rvConfig config;
    config.PutValue("k", "v", "");
    config.Section("other", 1);
    EXPECT_EQ(config.GetValue("k", static_cast<const char*>(nullptr), ""), nullptr);
    EXPECT_EQ(config.GetValue("k", static_cast<const char*>(nullptr), "other"), nullptr);
    EXPECT_STREQ(config.GetValue("k", "d", "defaults"), "v");

    // A miss hands back the caller's pointer and keeps the last hit's text.
    const char* hit = config.GetValue("k", "d", "defaults");
    const char* def = "d";
    EXPECT_EQ(config.GetValue("missing", def, "defaults"), def);
    EXPECT_STREQ(hit, "v");

    config.PutValue("empty", "", "defaults");
    EXPECT_STREQ(config.GetValue("empty", "d", "defaults"), "");
    config.PutValue("blank", "  spaced  ", "defaults");
    EXPECT_STREQ(config.GetValue("blank", "d", "defaults"), "  spaced  ");
}

TEST(RvConfigModel, CurrentSection)
{
    rvConfig config;
    config.PutValue("k", "v", "Net");
    EXPECT_STREQ(config.Section(), "defaults");  // storing elsewhere leaves it
    EXPECT_EQ(config.Section("x", 0), 0u);
    EXPECT_STREQ(config.Section(), "defaults");
    EXPECT_EQ(config.Section("NET", 0), 1u);
    EXPECT_STREQ(config.Section(), "NET");
    EXPECT_STREQ(config.GetValue("k", "d", ""), "v");

    const unsigned int items = config.IsValid();
    EXPECT_EQ(config.Section("fresh", 1), 1u);
    EXPECT_EQ(config.IsValid(), items + 1);
    EXPECT_EQ(config.IsModified(), 1u);  // from the PutValue, not the Section
    config.IsModified(0);
    config.Section("fresh2", 1);
    EXPECT_EQ(config.IsModified(), 0u);
}

TEST(RvConfigModel, CountersMoveByEvent)
{
    rvConfig config;
    config.PutValue("k", "v", "");
    config.PutValue("k", "v", "");
    EXPECT_EQ(config.IsValid(), 3u);  // the default section and two stores
    EXPECT_EQ(config.IsModified(), 1u);
    config.IsModified(0);
    config.RemoveKey("nosuch", "k");
    EXPECT_EQ(config.IsModified(), 1u);
    EXPECT_EQ(config.IsValid(), 3u);
    config.IsModified(7);
    EXPECT_EQ(config.IsModified(), 7u);

    config.DefaultSection("other");
    config.ConfigName("name.ini");
    config.Clear();
    EXPECT_EQ(config.IsValid(), 0u);
    EXPECT_EQ(config.IsModified(), 0u);
    EXPECT_EQ(config.SectionCnt(), 0u);
    EXPECT_STREQ(config.Section(), "");
    EXPECT_STREQ(config.DefaultSection(), "defaults");
    EXPECT_STREQ(config.ConfigName(), "name.ini");
    EXPECT_STREQ(static_cast<const char*>(config), "name.ini");
    EXPECT_EQ(config.m_sections.bucket_count(), 193u);

    // The current section is now "", so a store lands in a section named "".
    config.PutValue("k", "v", "");
    EXPECT_EQ(config.TokenCnt(""), 1u);
    EXPECT_EQ(config.TokenCnt("defaults"), 0u);
}

TEST(RvConfigModel, ConfigNameKeeps4094Characters)
{
    rvConfig config;
    config.ConfigName(std::string(5000, 'n').c_str());
    EXPECT_EQ(std::string(config.ConfigName()), std::string(4094, 'n'));
    config.ConfigName(config.ConfigName());
    EXPECT_EQ(std::string(config.ConfigName()), std::string(4094, 'n'));
    config.ConfigName(nullptr);
    EXPECT_STREQ(config.ConfigName(), "");
}

TEST(RvConfigOrder, BucketsUpwardNewestFirstInAChain)
{
    rvConfig config;
    config.Section("c", 1);
    config.Section("a", 1);
    config.Section("b", 1);
    EXPECT_EQ(sectionsInOrder(config), (std::vector<std::string>{"defaults", "a", "b", "c"}));

    config.PutValue("port", "1", "s");
    config.PutValue("timeout", "2", "s");
    EXPECT_EQ(keysInOrder(config, "s"), (std::vector<std::string>{"timeout", "port"}));
    EXPECT_STREQ(config.GetValue("port", "d", "s"), "1");
    EXPECT_STREQ(config.GetValue("timeout", "d", "s"), "2");
    config.PutValue("x", "1", "t");
    config.PutValue("y", "1", "t");
    EXPECT_EQ(keysInOrder(config, "t"), (std::vector<std::string>{"x", "y"}));
}

// port and timeout share a chain; growing from 193 to 389 buckets reverses it.
TEST(RvConfigOrder, GrowthAtThe194thEntryReversesChains)
{
    rvConfig config;
    config.Section("port", 1);
    config.Section("timeout", 1);
    for (int i = 0; config.SectionCnt() < 193; ++i) {
        config.Section(("filler" + std::to_string(i)).c_str(), 1);
    }
    EXPECT_EQ(config.m_sections.bucket_count(), 193u);
    std::vector<std::string> order = sectionsInOrder(config);
    EXPECT_LT(indexOf(order, "timeout"), indexOf(order, "port"));
    config.Section("one-more", 1);
    EXPECT_EQ(config.m_sections.bucket_count(), 389u);
    order = sectionsInOrder(config);
    EXPECT_GT(indexOf(order, "timeout"), indexOf(order, "port"));

    rvConfig keys;
    keys.PutValue("port", "1", "s");
    keys.PutValue("timeout", "2", "s");
    for (int i = 0; keys.TokenCnt("s") < 193; ++i) {
        keys.PutValue(("filler" + std::to_string(i)).c_str(), "v", "s");
    }
    EXPECT_EQ(keys.m_sections.find(cfgStr("s"))->second.bucket_count(), 193u);
    order = keysInOrder(keys, "s");
    EXPECT_LT(indexOf(order, "timeout"), indexOf(order, "port"));
    // A replacement in a full table counts as an insertion and grows it.
    keys.PutValue("port", "3", "s");
    EXPECT_EQ(keys.m_sections.find(cfgStr("s"))->second.bucket_count(), 389u);
    order = keysInOrder(keys, "s");
    EXPECT_GT(indexOf(order, "timeout"), indexOf(order, "port"));
    EXPECT_EQ(keys.TokenCnt("s"), 193u);
}

}  // namespace
