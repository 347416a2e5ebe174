// Reading configuration files: the line format, sections and counting, the
// open modes, and input that makes no sense.
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <random>
#include <string>

#include <dirent.h>
#include <fcntl.h>
#include <gtest/gtest.h>

#include "config/sys.h"
#include "config/temp_dir.h"
#include "support/scoped_sys_calls.h"
#include "tessaline/config/rvConfig.h"
#include "util/sys.h"

namespace {

using tessaline::test::ConfigDir;

const char* lookup(rvConfig& config, const char* key, const char* section)
{
    return config.GetValue(key, static_cast<const char*>(nullptr), section);
}

int openDescriptors()
{
    int count = 0;
    DIR* dir = opendir("/proc/self/fd");
    while (readdir(dir) != nullptr) {
        ++count;
    }
    closedir(dir);
    return count;
}

TEST(RvConfigReader, SingleLines)
{
    // Each line is followed by "probe = 1", which lands in the section that
    // the line selected. `key` and `value` are what the line itself stored.
    const struct {
        const char* line;
        const char* section;
        const char* key;
        const char* value;
    } rows[] = {
        {"[ name ] tail", "name", nullptr, nullptr},
        {"\xEF\xBB\xBF[name]", "name", nullptr, nullptr},  // a byte order mark: the first line only
        {"]name[", "name", nullptr, nullptr},
        {"[name", "name", nullptr, nullptr},
        {"[[name]]", "name", nullptr, nullptr},
        {"[a b]", "a b", nullptr, nullptr},
        {"[   ]", "", nullptr, nullptr},
        {"[]", "", nullptr, nullptr},
        {"key", "defaults", "key", nullptr},
        {"key =", "defaults", "key", nullptr},
        {"a==b", "defaults", "a", "=b"},
        {"=a=b", "defaults", "a", "b"},
        {"===", "defaults", nullptr, nullptr},
        {"a = 1 # 2", "defaults", "a", "1 # 2"},
        {"/x = 1", "defaults", "x", nullptr},
        {";x = 1", "defaults", "x", nullptr},
        {"#x = 1", "defaults", "x", nullptr},
        {"  \tk\t=  v w  ", "defaults", "k", "v w"},
        {"k = \"  quoted  \"", "defaults", "k", "  quoted  "},
        {"k = \"cut\" here", "defaults", "k", "cut"},
        {"k = \"open only", "defaults", "k", "open only"},
        {"k = \"a\"b\"", "defaults", "k", "a\"b"},
        {"k = \"\"", "defaults", "k", ""},
        {"a b = c", "defaults", "a b", "c"},
    };
    ConfigDir dir;
    for (const auto& row : rows) {
        SCOPED_TRACE(row.line);
        const std::string path = dir.Write("line.ini", std::string(row.line) + "\nprobe = 1\n");
        rvConfig config(path.c_str(), rvConfig::OpenRead);
        // "" in a lookup is the current section: select the empty name.
        config.Section(row.section, 0);
        EXPECT_STREQ(lookup(config, "probe", row.section), "1");
        const bool selectsSection = std::strcmp(row.section, "defaults") != 0;
        EXPECT_EQ(config.SectionCnt(), selectsSection ? 2u : 1u);
        if (row.key != nullptr) {
            const char* value = lookup(config, row.key, "defaults");
            if (row.value == nullptr) {
                EXPECT_EQ(value, nullptr);
            } else {
                EXPECT_STREQ(value, row.value);
            }
        }
        EXPECT_EQ(config.TokenCnt("defaults"), (row.value != nullptr ? 1u : 0u) + (selectsSection ? 0u : 1u));
    }
}

TEST(RvConfigReader, SectionsAndTheDefaultSection)
{
    ConfigDir dir;
    const std::string path = dir.Write("app.ini",
                                       "# header comment\n"
                                       "   top = 1\r\n"
                                       "  ; indented comment\n"
                                       "\n"
                                       "[Net]\n"
                                       "Port = 80\n"
                                       "port = 81\n"
                                       "[empty]\n"
                                       "[NET]\n"
                                       "host = h\n"
                                       "PORT = 82\n"
                                       "[defaults]\n"
                                       "late = 2\n"
                                       "last = no newline");
    rvConfig config(path.c_str(), rvConfig::OpenRead);
    EXPECT_STREQ(lookup(config, "top", "defaults"), "1");
    EXPECT_STREQ(lookup(config, "late", "defaults"), "2");
    EXPECT_STREQ(lookup(config, "last", "defaults"), "no newline");
    EXPECT_STREQ(lookup(config, "port", "net"), "80");
    EXPECT_STREQ(lookup(config, "HOST", "net"), "h");
    EXPECT_EQ(config.TokenCnt("net"), 2u);
    EXPECT_EQ(config.TokenCnt("empty"), 0u);
    EXPECT_EQ(config.SectionCnt(), 3u);
    EXPECT_STREQ(config.EnumSections(1), "defaults");
    EXPECT_STREQ(config.EnumSections(0), "Net");  // the first spelling stays
    // 7 key lines, two created sections; [NET] and [defaults] create nothing.
    EXPECT_EQ(config.IsValid(), 9u);
    EXPECT_EQ(config.IsModified(), 0u);
    EXPECT_STREQ(config.Section(), "defaults");
    EXPECT_STREQ(config.ConfigName(), path.c_str());
    EXPECT_EQ(config.Mode(), rvConfig::OpenRead);
    EXPECT_EQ(config.m_pFile, nullptr);
}

TEST(RvConfigReader, KeyNamesKeepTheirSpellingInEverySection)
{
    // Names repeat across sections and differ in case and in number, more
    // of them than the reader shares at once.
    std::string text;
    const char* spellings[] = {"port", "Port", "PORT"};
    for (int section = 0; section < 30; ++section) {
        text += "[s" + std::to_string(section) + "]\n" + spellings[section % 3] + " = p\n";
        for (int key = 0; key < 40; ++key) {
            text += "k" + std::to_string(section * 7 + key) + " = v\n";
        }
    }
    ConfigDir dir;
    rvConfig config(dir.Write("many.ini", text).c_str(), rvConfig::OpenRead);
    for (int section = 0; section < 30; ++section) {
        const std::string name = "s" + std::to_string(section);
        std::string keys;
        for (const char* key = config.EnumTokens(name.c_str(), 1); key != nullptr;
             key = config.EnumTokens(name.c_str(), 0)) {
            keys += std::string(key) + ",";
        }
        EXPECT_NE(keys.find(std::string(spellings[section % 3]) + ","), std::string::npos) << name << ": " << keys;
        for (int key = 0; key < 40; ++key) {
            const std::string own = "k" + std::to_string(section * 7 + key) + ",";
            EXPECT_NE(keys.find(own), std::string::npos) << name << " lacks " << own;
        }
    }
}

TEST(RvConfigReader, ReadReplacesContentAndStartsInTheDefaultSection)
{
    ConfigDir dir;
    const std::string path = dir.Write("app.ini", "above = 1\n[s]\nk = v\n");
    rvConfig config;
    config.PutValue("old", "x", "gone");
    config.DefaultSection("other");
    ASSERT_EQ(config.Load(path.c_str(), rvConfig::OpenRead), 1u);
    EXPECT_STREQ(lookup(config, "above", "other"), "1");
    EXPECT_EQ(config.TokenCnt("defaults"), 0u);
    EXPECT_EQ(config.SectionCnt(), 3u);  // defaults, other, s
    EXPECT_STREQ(config.DefaultSection(), "defaults");
    EXPECT_STREQ(config.Section(), "defaults");
    EXPECT_EQ(config.TokenCnt("gone"), 0u);
    EXPECT_EQ(config.IsValid(), 3u);

    const std::string comments = dir.Write("comments.ini", "# only\n\n; comments\n");
    ASSERT_EQ(config.Load(comments.c_str(), rvConfig::OpenRead), 1u);
    EXPECT_EQ(config.IsValid(), 0u);
    EXPECT_EQ(config.SectionCnt(), 1u);
    EXPECT_STREQ(config.EnumSections(1), "defaults");

    const std::string empty = dir.Write("section.ini", "[lonely]\n");
    ASSERT_EQ(config.Load(empty.c_str(), rvConfig::OpenRead), 1u);
    EXPECT_EQ(config.IsValid(), 1u);
    EXPECT_EQ(config.SectionCnt(), 2u);
}

TEST(RvConfigReader, LongLinesArePieces)
{
    ConfigDir dir;
    const std::string first = "k = " + std::string(4996, 'x');  // 5000 bytes
    const std::string second = "a = " + std::string(4090, 'y') + "b = 2";
    const std::string path = dir.Write("long.ini", first + "\n" + second + "\n");
    rvConfig config(path.c_str(), rvConfig::OpenRead);
    EXPECT_EQ(std::string(lookup(config, "k", "")), std::string(4090, 'x'));
    EXPECT_EQ(std::string(lookup(config, "a", "")), std::string(4090, 'y'));
    EXPECT_STREQ(lookup(config, "b", ""), "2");
    EXPECT_EQ(config.TokenCnt("defaults"), 3u);
}

TEST(RvConfigReader, OpenModes)
{
    ConfigDir dir;
    rvConfig created(dir.Path("missing.ini").c_str(), rvConfig::OpenUpdate);
    EXPECT_TRUE(dir.Exists("missing.ini"));
    EXPECT_EQ(created.IsValid(), 0u);
    EXPECT_EQ(created.Mode(), rvConfig::OpenUpdate);

    rvConfig kept(dir.Write("kept.ini", "k = v\n").c_str(), rvConfig::OpenUpdate);
    EXPECT_STREQ(lookup(kept, "k", ""), "v");
    EXPECT_EQ(dir.Read("kept.ini"), "k = v\n");

    rvConfig emptied(dir.Write("emptied.ini", "k = v\n").c_str(), rvConfig::OpenWrite);
    EXPECT_EQ(emptied.IsValid(), 0u);
    EXPECT_EQ(dir.Read("emptied.ini"), "");

    rvConfig directory(dir.Path("").c_str(), rvConfig::OpenRead);  // opens, yields nothing
    EXPECT_EQ(directory.IsValid(), 0u);
    EXPECT_EQ(directory.SectionCnt(), 1u);
}

TEST(RvConfigReader, OpenOwnsOneCloseOnExecStream)
{
    ConfigDir dir;
    const std::string path = dir.Write("app.ini", "k = v\n");
    rvConfig config;
    const int before = openDescriptors();
    FILE* first = config.Open(path.c_str(), rvConfig::OpenRead);
    ASSERT_NE(first, nullptr);
    EXPECT_NE(fcntl(fileno(first), F_GETFD) & FD_CLOEXEC, 0);
    ASSERT_NE(config.Open(path.c_str(), rvConfig::OpenUpdate), nullptr);
    EXPECT_EQ(openDescriptors(), before + 1);
    EXPECT_EQ(config.Mode(), rvConfig::OpenUpdate);
    EXPECT_EQ(config.Close(0), 1u);
    EXPECT_EQ(config.m_pFile, nullptr);
    EXPECT_EQ(openDescriptors(), before);
    EXPECT_EQ(config.IsValid(), 1u);  // Open reads nothing

    ASSERT_NE(config.Open(path.c_str(), rvConfig::OpenRead), nullptr);
    EXPECT_EQ(config.Serialize(0), 0u);
    EXPECT_EQ(config.m_pFile, nullptr);
    EXPECT_STREQ(lookup(config, "k", ""), "v");
}

TEST(RvConfigReader, BadInputIsReadWithoutHarm)
{
    ConfigDir dir;
    std::mt19937 random(20240611);
    std::string noise(256 * 1024, '\0');
    for (char& byte : noise) {
        byte = static_cast<char>(random());
    }
    const std::string lines("a = 1\0hidden = 2\nb\0 = 3\n[s\0ection]\nc = 4\n", 41);
    const std::string cases[] = {noise, lines, std::string(1 << 20, 'q') + " = 1\n", std::string(1 << 20, '=')};
    for (const std::string& content : cases) {
        const std::string path = dir.Write("bad.ini", content);
        rvConfig config(path.c_str(), rvConfig::OpenRead);
        EXPECT_GE(config.SectionCnt(), 1u);
        for (const char* section = config.EnumSections(1); section != nullptr; section = config.EnumSections(0)) {
            config.Section(section, 0);
            for (const char* key = config.EnumTokens(section, 1); key != nullptr; key = config.EnumTokens(section, 0)) {
                EXPECT_NE(lookup(config, key, ""), nullptr);
            }
        }
    }
    rvConfig config(dir.Write("nul.ini", lines).c_str(), rvConfig::OpenRead);
    EXPECT_STREQ(lookup(config, "a", ""), "1");
    EXPECT_EQ(lookup(config, "hidden", ""), nullptr);
    EXPECT_EQ(lookup(config, "b", ""), nullptr);
    EXPECT_STREQ(lookup(config, "c", "s"), "4");
}

TEST(RvConfigReader, FailedLoadKeepsEverything)
{
    ConfigDir dir;
    const std::string path = dir.Write("unreadable.ini", "k = v\n");
    rvConfig config;
    config.PutValue("mine", "1", "s");
    config.Mode(rvConfig::OpenUpdate);
    config.ConfigName("before.ini");
    static long paused;
    paused = 0;
    {
        tessaline::testing::ScopedSysCalls calls(tessaline::config::Sys());
        tessaline::testing::ScopedSysCalls pauses(tessaline::util::Sys());
        tessaline::config::Sys().fopen = [](const char*, const char*) -> FILE* { return errno = EACCES, nullptr; };
        tessaline::util::Sys().nanosleep = [](const timespec* pause, timespec*) { return paused += pause->tv_sec, 0; };
        EXPECT_EQ(config.Load(path.c_str(), rvConfig::OpenRead), 0u);
    }
    EXPECT_EQ(paused, 3);  // three tries one second apart
    EXPECT_STREQ(lookup(config, "mine", "s"), "1");
    EXPECT_EQ(config.IsModified(), 1u);
    EXPECT_STREQ(config.ConfigName(), "before.ini");
    EXPECT_EQ(config.Mode(), rvConfig::OpenUpdate);
    EXPECT_EQ(config.m_pFile, nullptr);
    // A null name fails without waiting.
    EXPECT_EQ(config.Open(nullptr, rvConfig::OpenRead), nullptr);
    // A read error in the middle of the file ends the reading there.
    {
        tessaline::testing::ScopedSysCalls calls(tessaline::config::Sys());
        tessaline::config::Sys().fgets = [](char* line, int size, FILE* stream) -> char* {
            return std::ftell(stream) > 0 ? (errno = EIO, nullptr) : std::fgets(line, size, stream);
        };
        EXPECT_EQ(config.Load(dir.Write("two.ini", "a = 1\nb = 2\n").c_str(), rvConfig::OpenRead), 1u);
    }
    EXPECT_STREQ(lookup(config, "a", ""), "1");
    EXPECT_EQ(lookup(config, "b", ""), nullptr);
}

}  // namespace
