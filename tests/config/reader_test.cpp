// Reading configuration files: the line format, sections, the open modes,
// and files that cannot be read.
#include <cerrno>
#include <cstdio>
#include <cstring>
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
using tessaline::testing::ScopedSysCalls;

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
        std::string line;
        const char* section;
        const char* key;
        const char* value;
    } rows[] = {
        {"[ name ] tail", "name", nullptr, nullptr},
        {"\xEF\xBB\xBF[name]", "name", nullptr, nullptr},  // a byte order mark: the first line only
        {"]name[", "name", nullptr, nullptr},
        {"[name", "name", nullptr, nullptr},
        {"[[name]]", "name", nullptr, nullptr},
        {"[   ]", "", nullptr, nullptr},
        {"key =", "defaults", "key", nullptr},
        {"a==b", "defaults", "a", "=b"},
        {"=a=b", "defaults", "a", "b"},
        {"===", "defaults", nullptr, nullptr},
        {"a = 1 # 2", "defaults", "a", "1 # 2"},
        {"/x = 1", "defaults", "x", nullptr},
        {";x = 1", "defaults", "x", nullptr},
        {"  \tk\t=  v w  \r", "defaults", "k", "v w"},
        {"k = \"  quoted  \"", "defaults", "k", "  quoted  "},
        {"k = \"cut\" here", "defaults", "k", "cut"},
        {"k = \"open only", "defaults", "k", "open only"},
        {"k = \"a\"b\"", "defaults", "k", "a\"b"},
        {"k = \"\"", "defaults", "k", ""},
        {std::string("a = 1\0hidden = 2", 16), "defaults", "a", "1"},  // a NUL ends the line
    };
    ConfigDir dir;
    for (const auto& row : rows) {
        SCOPED_TRACE(row.line);
        const std::string path = dir.Write("line.ini", row.line + "\nprobe = 1\n");
        rvConfig config(path.c_str(), rvConfig::OpenRead);
        // "" in a lookup is the current section: select the empty name.
        config.Section(row.section, 0);
        EXPECT_STREQ(lookup(config, "probe", row.section), "1");
        const bool selectsSection = std::strcmp(row.section, "defaults") != 0;
        EXPECT_EQ(config.SectionCnt(), selectsSection ? 2u : 1u);
        if (row.key != nullptr && row.value == nullptr) {
            EXPECT_EQ(lookup(config, row.key, "defaults"), nullptr);
        } else if (row.key != nullptr) {
            EXPECT_STREQ(lookup(config, row.key, "defaults"), row.value);
        }
        EXPECT_EQ(config.TokenCnt("defaults"), (row.value != nullptr ? 1u : 0u) + (selectsSection ? 0u : 1u));
    }
}

TEST(RvConfigReader, SectionsMergeAndLoadStartsAfresh)
{
    ConfigDir dir;
    const std::string text = "top = 1\n[Net]\nPort = 80\nport = 81\n[empty]\n[NET]\nhost = h\n[defaults]\nlast = x";
    const std::string path = dir.Write("app.ini", text);
    rvConfig config;
    config.PutValue("old", "x", "gone");
    config.DefaultSection("other");
    ASSERT_EQ(config.Load(path.c_str(), rvConfig::OpenRead), 1u);
    EXPECT_STREQ(lookup(config, "top", "other"), "1");      // the default section of the object at the time
    EXPECT_STREQ(lookup(config, "last", "defaults"), "x");  // without a line end
    EXPECT_STREQ(lookup(config, "port", "net"), "80");
    EXPECT_EQ(config.TokenCnt("net"), 2u);
    EXPECT_EQ(config.TokenCnt("gone"), 0u);
    EXPECT_EQ(config.SectionCnt(), 4u);
    // 5 key lines, two created sections; [NET] and [defaults] create nothing.
    EXPECT_EQ(config.IsValid(), 7u);
    EXPECT_EQ(config.IsModified(), 0u);
    EXPECT_STREQ(config.Section(), "defaults");
    EXPECT_STREQ(config.DefaultSection(), "defaults");

    // Many sections whose keys repeat in other spellings: each keeps its own.
    std::string many;
    const char* spellings[] = {"port", "Port", "PORT"};
    for (int section = 0; section < 30; ++section) {
        many += "[s" + std::to_string(section) + "]\n" + spellings[section % 3] + " = p\n";
        for (int key = 0; key < 40; ++key) {
            many += "k" + std::to_string(section * 7 + key) + " = v\n";
        }
    }
    ASSERT_EQ(config.Load(dir.Write("many.ini", many).c_str(), rvConfig::OpenRead), 1u);
    for (int section = 0; section < 30; ++section) {
        const std::string name = "s" + std::to_string(section);
        std::string keys = ",";
        for (const char* key = config.EnumTokens(name.c_str(), 1); key != nullptr;
             key = config.EnumTokens(name.c_str(), 0)) {
            keys += std::string(key) + ",";
        }
        EXPECT_NE(keys.find(std::string(",") + spellings[section % 3] + ","), std::string::npos) << name;
        EXPECT_EQ(config.TokenCnt(name.c_str()), 41u);
    }
}

TEST(RvConfigReader, OpenModesAndTheStream)
{
    ConfigDir dir;
    rvConfig emptied(dir.Write("emptied.ini", "k = v\n").c_str(), rvConfig::OpenWrite);
    EXPECT_EQ(emptied.IsValid(), 0u);
    EXPECT_EQ(dir.Read("emptied.ini"), "");
    rvConfig directory(dir.Path("").c_str(), rvConfig::OpenRead);  // opens, yields nothing
    EXPECT_EQ(directory.SectionCnt(), 1u);

    const std::string path = dir.Write("app.ini", "k = v\n");
    rvConfig config;
    const int before = openDescriptors();
    FILE* first = config.Open(path.c_str(), rvConfig::OpenRead);
    ASSERT_NE(first, nullptr);
    EXPECT_NE(fcntl(fileno(first), F_GETFD) & FD_CLOEXEC, 0);
    ASSERT_NE(config.Open(path.c_str(), rvConfig::OpenUpdate), nullptr);
    EXPECT_EQ(openDescriptors(), before + 1);
    EXPECT_EQ(config.Close(0), 1u);
    EXPECT_EQ(openDescriptors(), before);
    EXPECT_EQ(config.IsValid(), 1u);  // Open reads nothing
    ASSERT_NE(config.Open(path.c_str(), rvConfig::OpenRead), nullptr);
    EXPECT_EQ(config.Serialize(0), 0u);
    EXPECT_EQ(config.m_pFile, nullptr);
    EXPECT_STREQ(lookup(config, "k", ""), "v");
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
        ScopedSysCalls calls(tessaline::config::Sys());
        ScopedSysCalls pauses(tessaline::util::Sys());
        tessaline::config::Sys().fopen = [](const char*, const char*) -> FILE* { return errno = EACCES, nullptr; };
        tessaline::util::Sys().nanosleep = [](const timespec* pause, timespec*) { return paused += pause->tv_sec, 0; };
        EXPECT_EQ(config.Load(path.c_str(), rvConfig::OpenRead), 0u);
    }
    EXPECT_EQ(paused, 3);  // three tries one second apart
    EXPECT_STREQ(lookup(config, "mine", "s"), "1");
    EXPECT_EQ(config.IsModified(), 1u);
    EXPECT_STREQ(config.ConfigName(), "before.ini");
    EXPECT_EQ(config.Mode(), rvConfig::OpenUpdate);
    EXPECT_EQ(config.Open(nullptr, rvConfig::OpenRead), nullptr);  // at once, without waiting
    // A read error in the middle of the file ends the reading there.
    {
        ScopedSysCalls calls(tessaline::config::Sys());
        tessaline::config::Sys().fgets = [](char* line, int size, FILE* stream) -> char* {
            return std::ftell(stream) > 0 ? (errno = EIO, nullptr) : std::fgets(line, size, stream);
        };
        EXPECT_EQ(config.Load(dir.Write("two.ini", "a = 1\nb = 2\n").c_str(), rvConfig::OpenRead), 1u);
    }
    EXPECT_STREQ(lookup(config, "a", ""), "1");
    EXPECT_EQ(lookup(config, "b", ""), nullptr);
}

}  // namespace
