// The table of sections and keys: hashing, bucket order, lookup and store,
// the current and default sections, and the counters.
#include <algorithm>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "config/temp_dir.h"
#include "tessaline/config/rvConfig.h"

namespace {

using cfgStr = rvConfig::cfgStr;
using Names = std::vector<std::string>;

Names sectionsInOrder(rvConfig& config)
{
    Names names;
    for (const char* name = config.EnumSections(1); name != nullptr; name = config.EnumSections(0)) {
        names.push_back(name);
    }
    return names;
}

Names keysInOrder(rvConfig& config, const char* section)
{
    Names names;
    for (const char* name = config.EnumTokens(section, 1); name != nullptr; name = config.EnumTokens(section, 0)) {
        names.push_back(name);
    }
    return names;
}

bool comesBefore(const Names& names, const char* first, const char* second)
{
    return std::find(names.begin(), names.end(), first) < std::find(names.begin(), names.end(), second);
}

TEST(RvConfigHash, FiveBytesFromTheEndFoldedAndSigned)
{
    const rvConfig::rvstrhashfunction hash;
    EXPECT_EQ(hash(cfgStr("defaults")), 3515u);
    EXPECT_EQ(hash(cfgStr("DEFAULTS")), 3515u);
    EXPECT_EQ(hash(cfgStr("a")), 97u);
    EXPECT_EQ(hash(cfgStr("port")), 691u);
    EXPECT_EQ(hash(cfgStr("timeout")), 691u);
    EXPECT_EQ(hash(cfgStr("abcdefghijklmnopqrstuvwxyz")), 4775u);
    EXPECT_EQ(hash(cfgStr("xbcdefghijklmnopqrstuvwxyz")), 4775u);  // outside the probes
    EXPECT_EQ(hash(cfgStr("\xE9")), 4294967273u);
    EXPECT_EQ(hash(cfgStr("\xE9")) % 389, 379u);
    EXPECT_EQ(hash(cfgStr("")), 0u);
    // A rope made of pieces hashes and compares like its flat text.
    __gnu_cxx::crope pieces("abcdefghijklm");
    pieces += __gnu_cxx::crope(std::string(40, 'n').c_str());
    const cfgStr flat(std::string("abcdefghijklm" + std::string(40, 'N')).c_str());
    EXPECT_EQ(hash(cfgStr(pieces)), hash(flat));
    EXPECT_TRUE(rvConfig::eqcstr()(cfgStr(pieces), flat));
}

TEST(RvConfigCfgStr, CopiesCallersTextAndSharesItsOwn)
{
    EXPECT_TRUE(cfgStr("").empty());
    EXPECT_TRUE(cfgStr(nullptr).empty());
    EXPECT_STREQ(cfgStr().c_str(), "");
    char buffer[] = "text";
    const cfgStr copied(buffer);
    buffer[0] = 'n';
    EXPECT_STREQ(copied.c_str(), "text");
    EXPECT_EQ(cfgStr(copied).c_str(), copied.c_str());
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
}

TEST(RvConfigModel, LookupIgnoresCaseInOneSectionOnly)
{
    rvConfig config;
    config.PutValue("Port", "1", "Net");
    EXPECT_STREQ(config.GetValue("PORT", "9", "net"), "1");
    config.PutValue("PORT", "2", "net");
    EXPECT_STREQ(config.GetValue("port", "9", "NET"), "2");
    EXPECT_EQ(sectionsInOrder(config), (Names{"defaults", "Net"}));
    EXPECT_EQ(keysInOrder(config, "net"), Names{"Port"});

    config.PutValue("k", "v", "");
    config.Section("other", 1);
    EXPECT_EQ(config.GetValue("k", static_cast<const char*>(nullptr), ""), nullptr);
    EXPECT_EQ(config.GetValue("k", static_cast<const char*>(nullptr), "net"), nullptr);
    const char* hit = config.GetValue("k", "d", "defaults");
    const char* def = "d";
    EXPECT_EQ(config.GetValue("missing", def, "defaults"), def);
    EXPECT_STREQ(hit, "v");  // a miss keeps the last hit's text

    config.PutValue("empty", "", "defaults");
    EXPECT_STREQ(config.GetValue("empty", "d", "defaults"), "");
    config.PutValue("blank", "  spaced  ", "defaults");
    EXPECT_STREQ(config.GetValue("blank", "d", "defaults"), "  spaced  ");
}

TEST(RvConfigModel, CurrentSectionAndCounters)
{
    rvConfig config;
    config.PutValue("k", "v", "Net");
    config.PutValue("k", "v", "Net");
    EXPECT_STREQ(config.Section(), "defaults");
    EXPECT_EQ(config.IsValid(), 3u);  // the default section and two stores
    EXPECT_EQ(config.Section("x", 0), 0u);
    EXPECT_STREQ(config.Section(), "defaults");
    EXPECT_EQ(config.Section("NET", 0), 1u);
    EXPECT_STREQ(config.Section(), "NET");
    EXPECT_STREQ(config.GetValue("k", "d", ""), "v");

    config.IsModified(0);
    EXPECT_EQ(config.Section("fresh", 1), 1u);
    EXPECT_EQ(config.IsValid(), 4u);
    EXPECT_EQ(config.IsModified(), 0u);
    config.RemoveKey("nosuch", "k");
    EXPECT_EQ(config.IsModified(), 1u);
    EXPECT_EQ(config.IsValid(), 4u);

    config.DefaultSection("other");
    config.ConfigName("name.ini");
    config.Clear();
    EXPECT_EQ(config.IsValid(), 0u);
    EXPECT_EQ(config.IsModified(), 0u);
    EXPECT_EQ(config.SectionCnt(), 0u);
    EXPECT_STREQ(config.Section(), "");
    EXPECT_STREQ(config.DefaultSection(), "defaults");
    EXPECT_STREQ(static_cast<const char*>(config), "name.ini");
    EXPECT_EQ(config.m_sections.bucket_count(), 193u);
    config.PutValue("k", "v", "");  // the current section is now ""
    EXPECT_EQ(config.TokenCnt(""), 1u);
}

TEST(RvConfigModel, ConfigNameKeeps4094Characters)
{
    rvConfig config;
    config.ConfigName(std::string(5000, 'n').c_str());
    EXPECT_EQ(std::string(config.ConfigName()), std::string(4094, 'n'));
    config.ConfigName(config.ConfigName());
    EXPECT_EQ(std::string(config.ConfigName()), std::string(4094, 'n'));
}

TEST(RvConfigOrder, BucketsUpwardNewestFirstInAChain)
{
    rvConfig config;
    for (const char* name : {"c", "a", "b"}) {
        config.Section(name, 1);
    }
    EXPECT_EQ(sectionsInOrder(config), (Names{"defaults", "a", "b", "c"}));
    config.PutValue("port", "1", "s");
    config.PutValue("timeout", "2", "s");
    EXPECT_EQ(keysInOrder(config, "s"), (Names{"timeout", "port"}));
    EXPECT_STREQ(config.GetValue("port", "d", "s"), "1");
}

// port and timeout share a chain; growing from 193 to 389 buckets at the
// 194th entry reverses it.
TEST(RvConfigOrder, GrowthAtThe194thEntryReversesChains)
{
    rvConfig sections;
    sections.Section("port", 1);
    sections.Section("timeout", 1);
    for (int i = 0; sections.SectionCnt() < 193; ++i) {
        sections.Section(("filler" + std::to_string(i)).c_str(), 1);
    }
    EXPECT_TRUE(comesBefore(sectionsInOrder(sections), "timeout", "port"));
    sections.Section("one-more", 1);
    EXPECT_EQ(sections.m_sections.bucket_count(), 389u);
    EXPECT_TRUE(comesBefore(sectionsInOrder(sections), "port", "timeout"));

    rvConfig keys;
    keys.PutValue("port", "1", "s");
    keys.PutValue("timeout", "2", "s");
    for (int i = 0; keys.TokenCnt("s") < 193; ++i) {
        keys.PutValue(("filler" + std::to_string(i)).c_str(), "v", "s");
    }
    EXPECT_TRUE(comesBefore(keysInOrder(keys, "s"), "timeout", "port"));
    keys.PutValue("port", "3", "s");  // a replacement in a full table grows it too
    EXPECT_TRUE(comesBefore(keysInOrder(keys, "s"), "port", "timeout"));
    EXPECT_EQ(keys.TokenCnt("s"), 193u);
}

// Names that agree in every byte the name hash reads (1, 3, 8, 14 and 18
// from the end) all share one chain, as a hostile file would have them.
TEST(RvConfigOrder, NamesThatShareOneChain)
{
    const auto name = [](int n, char base) {
        std::string digits = std::to_string(n);
        digits.insert(0, 15 - digits.size(), '0');
        std::string text(20, base == 'a' ? 'x' : 'X');
        for (int i = 0, d = 0; i < 20; ++i) {
            if (i != 2 && i != 6 && i != 12 && i != 17 && i != 19) {
                text[i] = static_cast<char>(base + (digits[d++] - '0'));
            }
        }
        return text;
    };
    constexpr int kNames = 2000;
    std::string file = "[s]\n";
    for (int n = 0; n < kNames; ++n) {
        file += name(n, 'a') + " = v" + std::to_string(n) + "\n";
    }
    file += name(7, 'A') + " = second\n";
    const tessaline::test::ConfigDir dir;
    rvConfig config(dir.Write("collide.ini", file).c_str(), rvConfig::OpenRead);

    // Newest first in the chain, which each growth (193, 389, 769, 1543)
    // reverses.
    Names expected;
    for (int n = 0; n < kNames; ++n) {
        if (n == 193 || n == 389 || n == 769 || n == 1543) {
            std::reverse(expected.begin(), expected.end());
        }
        expected.insert(expected.begin(), name(n, 'a'));
    }
    EXPECT_EQ(keysInOrder(config, "s"), expected);
    EXPECT_EQ(config.m_sections.find("s")->second.bucket_count(), 3079u);

    int wrong = 0;
    for (int n = 0; n < kNames; ++n) {
        const char* value = config.GetValue(name(n, 'A').c_str(), static_cast<const char*>(nullptr), "S");
        wrong += value == nullptr || value != "v" + std::to_string(n);
    }
    EXPECT_EQ(wrong, 0);
    EXPECT_EQ(config.GetValue(name(kNames, 'a').c_str(), static_cast<const char*>(nullptr), "s"), nullptr);

    for (int n = 0; n < kNames; n += 2) {
        config.RemoveKey("s", name(n, 'a').c_str());
    }
    for (int n = 0; n < kNames; ++n) {
        const bool found = config.GetValue(name(n, 'A').c_str(), static_cast<const char*>(nullptr), "s") != nullptr;
        wrong += found != (n % 2 == 1);
    }
    EXPECT_EQ(wrong, 0);
    EXPECT_EQ(config.TokenCnt("s"), unsigned(kNames / 2));
}

}  // namespace
