// The table of sections and keys: hashing, lookup and store, the current and
// default sections, enumeration and its order, removal, and the typed
// accessors.
#include <algorithm>
#include <cstdlib>
#include <string>
#include <utility>
#include <vector>

#include <locale.h>

#include <gtest/gtest.h>

#include "config/temp_dir.h"
#include "tessaline/config/rvConfig.h"

namespace {

using cfgStr = rvConfig::cfgStr;
using Names = std::vector<std::string>;

const char* lookup(rvConfig& config, const char* key, const char* section)
{
    return config.GetValue(key, static_cast<const char*>(nullptr), section);
}

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
    EXPECT_EQ(hash(cfgStr("DEFAULTS")), 3515u);
    EXPECT_EQ(hash(cfgStr("port")), 691u);
    EXPECT_EQ(hash(cfgStr("timeout")), 691u);
    EXPECT_EQ(hash(cfgStr("xbcdefghijklmnopqrstuvwxyz")), 4775u);
    EXPECT_EQ(hash(cfgStr("\xE9")), 4294967273u);
    EXPECT_EQ(hash(cfgStr("")), 0u);
    // A rope made of pieces hashes and compares like its flat text.
    __gnu_cxx::crope pieces("abcdefghijklm");
    pieces += __gnu_cxx::crope(std::string(40, 'n').c_str());
    const cfgStr flat(std::string("abcdefghijklm" + std::string(40, 'N')).c_str());
    EXPECT_EQ(hash(cfgStr(pieces)), hash(flat));
    EXPECT_TRUE(rvConfig::eqcstr()(cfgStr(pieces), flat));

    char buffer[] = "text";
    const cfgStr copied(buffer);
    buffer[0] = 'n';
    EXPECT_STREQ(copied.c_str(), "text");
    EXPECT_TRUE(cfgStr(__gnu_cxx::crope(1, '\0')).empty());  // a rope whose text ends at once
}

TEST(RvConfigModel, LookupStoreRemoveAndCounters)
{
    rvConfig config;
    config.PutValue("Port", "1", "Net");
    config.PutValue("PORT", "2", "net");
    EXPECT_STREQ(config.GetValue("port", "9", "NET"), "2");
    EXPECT_EQ(sectionsInOrder(config), (Names{"defaults", "Net"}));  // the first spelling stays
    EXPECT_EQ(keysInOrder(config, "net"), Names{"Port"});
    EXPECT_EQ(config.IsValid(), 3u);  // the default section and two stores
    config.PutValue("k", "v", "");
    EXPECT_EQ(lookup(config, "k", "net"), nullptr);
    const char* hit = config.GetValue("k", "d", "defaults");
    const char* def = "d";
    EXPECT_EQ(config.GetValue("missing", def, "defaults"), def);
    EXPECT_STREQ(hit, "v");  // a miss keeps the last hit's text

    EXPECT_EQ(config.Section("x", 0), 0u);
    EXPECT_EQ(config.Section("NET", 0), 1u);
    EXPECT_STREQ(config.GetValue("port", "d", ""), "2");
    EXPECT_EQ(config.TokenCnt(""), 0u);  // the current section does not stand in for ""
    config.IsModified(0);
    config.RemoveKey("nosuch", "k");
    EXPECT_EQ(config.IsModified(), 1u);
    config.RemoveKey("net", "port");
    EXPECT_EQ(config.TokenCnt("Net"), 0u);
    config.RemoveSection("net");
    EXPECT_EQ(config.SectionCnt(), 1u);
    EXPECT_STREQ(config.Section(), "NET");  // still current: a store makes it again
    config.PutValue("k", "3", "");
    EXPECT_STREQ(config.GetValue("k", "d", "net"), "3");
    EXPECT_EQ(config.IsValid(), 5u);  // removals count nothing

    config.DefaultSection("other");
    config.ConfigName(std::string(5000, 'n').c_str());
    config.Clear();
    EXPECT_EQ(config.IsValid(), 0u);
    EXPECT_EQ(config.EnumSections(1), nullptr);
    EXPECT_STREQ(config.DefaultSection(), "defaults");
    EXPECT_EQ(std::string(config), std::string(4094, 'n'));
    config.PutValue("k", "v", "");  // the current section is now ""
    EXPECT_EQ(config.TokenCnt(""), 1u);
}

// Which names are one is strcasecmp's answer in the thread's locale. Where
// that folds more than A-Z, as Latin-1 folds \xc4 to \xe4, lookups follow it.
TEST(RvConfigModel, NamesFoldAsTheThreadsLocaleFolds)
{
    using tessaline::config::AsciiCaseFolding;
    using tessaline::config::AsciiFoldedEqual;
    EXPECT_TRUE(AsciiCaseFolding());
    EXPECT_TRUE(AsciiCaseFolding());  // now from the table last checked
    EXPECT_TRUE(AsciiFoldedEqual("Key_1", "kEY_1"));
    for (const auto& pair : {std::pair{"key", "kez"}, {"[", "{"}, {"@", "`"}, {"k", "k\xe4"}, {"\xc4", "\xe4"}}) {
        EXPECT_FALSE(AsciiFoldedEqual(pair.first, pair.second)) << pair.first << " " << pair.second;
    }
    rvConfig config;
    config.PutValue("\xc4pfel", "1", "Obst");
    EXPECT_EQ(lookup(config, "\xe4pfel", "obst"), nullptr);

#ifdef __SANITIZE_ADDRESS__
    GTEST_SKIP() << "the sanitizer's strcasecmp folds A-Z alone, and newlocale keeps LOCPATH for good";
#endif
    const tessaline::test::ConfigDir dir;
    const std::string build = "localedef -i de_DE -f ISO-8859-1 " + dir.Path("de_DE.ISO-8859-1") + " 2>/dev/null";
    setenv("LOCPATH", dir.path().c_str(), 1);
    const locale_t latin1 =
        std::system(build.c_str()) == 0 ? newlocale(LC_CTYPE_MASK, "de_DE.ISO-8859-1", nullptr) : nullptr;
    unsetenv("LOCPATH");
    if (latin1 == nullptr) {
        GTEST_SKIP() << "no Latin-1 locale could be built";
    }
    const locale_t previous = uselocale(latin1);
    const bool folding = AsciiCaseFolding();
    const char* found = lookup(config, "\xe4PFEL", "OBST");
    uselocale(previous);
    freelocale(latin1);
    EXPECT_FALSE(folding);
    EXPECT_STREQ(found, "1");
}

TEST(RvConfigEnumerate, OneCursorThatRestartsAfterTheEnd)
{
    rvConfig config;
    EXPECT_EQ(config.EnumSections(0), nullptr);  // no start yet
    config.PutValue("y", "1", "s");
    config.PutValue("x", "1", "s");
    config.PutValue("k", "1", "t");
    EXPECT_STREQ(config.EnumTokens("S", 1), "x");
    EXPECT_STREQ(config.EnumTokens("s", 0), "y");
    EXPECT_EQ(config.EnumTokens("s", 0), nullptr);
    EXPECT_STREQ(config.EnumTokens("s", 0), "x");
    EXPECT_STREQ(config.EnumTokens("t", 0), "y");  // one cursor, whatever the name
    EXPECT_EQ(config.EnumTokens("nosuch", 1), nullptr);
}

// Buckets upward, newest first in a chain. port and timeout share a chain;
// growing from 193 to 389 buckets at the 194th entry reverses it.
TEST(RvConfigOrder, BucketsUpwardAndGrowthReversesChains)
{
    rvConfig sections;
    for (const char* name : {"c", "a", "b", "port", "timeout"}) {
        sections.Section(name, 1);
    }
    EXPECT_EQ(sectionsInOrder(sections), (Names{"defaults", "a", "b", "c", "timeout", "port"}));
    for (int i = 0; sections.SectionCnt() < 193; ++i) {
        sections.Section(("filler" + std::to_string(i)).c_str(), 1);
    }
    EXPECT_EQ(sections.m_sections.bucket_count(), 193u);
    EXPECT_TRUE(comesBefore(sectionsInOrder(sections), "timeout", "port"));
    sections.Section("one-more", 1);
    EXPECT_EQ(sections.m_sections.bucket_count(), 389u);
    EXPECT_TRUE(comesBefore(sectionsInOrder(sections), "port", "timeout"));
    sections.m_sections.resize(769);  // room for 768 entries: no growth beyond
    EXPECT_EQ(sections.m_sections.bucket_count(), 769u);

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

    for (int n = 0; n < kNames; n += 2) {
        config.RemoveKey("s", name(n, 'a').c_str());
    }
    int wrong = 0;
    for (int n = 0; n < kNames; ++n) {
        const char* value = lookup(config, name(n, 'A').c_str(), "S");
        wrong += n % 2 == 0 ? value != nullptr : value == nullptr || value != "v" + std::to_string(n);
    }
    EXPECT_EQ(wrong, 0);
    EXPECT_EQ(config.TokenCnt("s"), unsigned(kNames / 2));
}

TEST(RvConfigTyped, NumbersSaturateAndBoolsAreWholeWords)
{
    rvConfig config;
    EXPECT_EQ(config.GetValue("n", 5, ""), 5);
    EXPECT_EQ(config.GetBool("b", 7, ""), 7u);
    const struct {
        const char* text;
        int number;
        double real;
        unsigned int flag;
    } rows[] = {{"12abc", 12, 12.0, 7},
                {" 42", 42, 42.0, 7},
                {"0x10", 0, 16.0, 7},
                {"1e3", 1, 1e3, 7},
                {"99999999999", 2147483647, 99999999999.0, 7},
                {"-99999999999", -2147483647 - 1, -99999999999.0, 7},
                {"tRuE", 0, 0.0, 1},
                {"1", 1, 1.0, 1},
                {"FALSE", 0, 0.0, 0},
                {"0", 0, 0.0, 0},
                {"00", 0, 0.0, 7},
                {" true", 0, 0.0, 7}};
    for (const auto& row : rows) {
        config.PutValue("n", row.text, "");
        config.IsModified(0);
        EXPECT_EQ(config.GetValue("n", 5, ""), row.number) << row.text;
        EXPECT_EQ(config.GetValue("n", 2.5, ""), row.real) << row.text;
        EXPECT_EQ(config.GetBool("n", 7, ""), row.flag) << row.text;
        EXPECT_EQ(config.IsModified(), 0u);
    }
    const struct {
        void (*store)(rvConfig& config);
        const char* text;
    } stores[] = {{[](rvConfig& c) { c.PutBool("n", 2, ""); }, "True"},
                  {[](rvConfig& c) { c.PutBool("n", 0, ""); }, "False"},
                  {[](rvConfig& c) { c.PutValue("n", -7, ""); }, "-7"},
                  {[](rvConfig& c) { c.PutValue("n", 1.5, ""); }, "1.500000"},
                  // Too long for "%f" in 32 bytes: a form that fits and reads back.
                  {[](rvConfig& c) { c.PutValue("n", -1e300, ""); }, "-1.0000000000000001e+300"},
                  {[](rvConfig& c) { c.PutValue("n", __gnu_cxx::crope("rope"), __gnu_cxx::crope()); }, "rope"}};
    for (const auto& row : stores) {
        row.store(config);
        EXPECT_STREQ(config.GetValue("n", "", ""), row.text);
    }
    __gnu_cxx::crope out;
    config.GetValue(out, __gnu_cxx::crope("N"), __gnu_cxx::crope("def"), __gnu_cxx::crope(""));
    EXPECT_STREQ(out.c_str(), "rope");
}

}  // namespace
