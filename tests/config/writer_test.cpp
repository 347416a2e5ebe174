// Saving: the merge of table and old file, side files, and what each
// failure leaves on disk and in memory.
#include <cerrno>
#include <filesystem>
#include <fstream>
#include <initializer_list>
#include <string>

#include <gtest/gtest.h>

#include <unistd.h>

#include "config/sys.h"
#include "config/temp_dir.h"
#include "support/scoped_sys_calls.h"
#include "tessaline/config/rvConfig.h"

namespace {

using tessaline::test::body;
using tessaline::test::ConfigDir;
// One change to the table: a store, or with no value the removal of the key,
// or with no key either the removal of the section.
struct Edit {
    const char* section;
    const char* key;
    const char* value;
};

std::string rewrite(const std::string& content, std::initializer_list<Edit> edits)
{
    ConfigDir dir;
    rvConfig config(dir.Write("app.ini", content).c_str(), rvConfig::OpenUpdate);
    for (const Edit& edit : edits) {
        if (edit.key == nullptr) {
            config.RemoveSection(edit.section);
        } else if (edit.value == nullptr) {
            config.RemoveKey(edit.section, edit.key);
        } else {
            config.PutValue(edit.key, edit.value, edit.section);
        }
    }
    config.IsModified(1);
    EXPECT_EQ(config.Flush(0), 1u);
    EXPECT_FALSE(dir.Exists("app.new"));
    return body(dir.Read("app.ini"));
}

TEST(RvConfigWriter, WorkedCaseLineForLine)
{
    EXPECT_EQ(rewrite("# comment\na = 1\n\n[s1]\nb = 2\nc = 3\n# second\n[s2]\nd = 4\n"
                      "# Edited by Tessaline: January 01, 2020 - 00:00:00\n",
                      {{"", "e", "5"}, {"s1", "b", "22"}, {"s1", "f", "6"}, {"s1", "c", nullptr}, {"s3", "g", "7"}}),
              "# comment\na = 1\n\ne = 5\n[s1]\nb = 22\n# second\nf = 6\n[s2]\nd = 4\n[s3]\ng = 7\n");
}

TEST(RvConfigWriter, LayoutSurvives)
{
    const struct {
        const char* old;
        std::initializer_list<Edit> edits;
        const char* expected;
    } rows[] = {
        // Only blank lines keep their carriage returns and blanks.
        {"  # indented\r\n \t \r\n[Net]\nPort=\"80\"\n", {}, "  # indented\n \t \r\n[Net]\nPort = 80\n"},
        {"[a]\n# about a\nk = 1\n[b]\nj = 2\n", {{"a", nullptr, nullptr}}, "# about a\n[b]\nj = 2\n"},
        {"[s]\nx = 1\n[t]\nk = 1\n[S]\n# 2nd\ny = 2\nx = 3\n", {}, "[s]\nx = 1\ny = 2\n[t]\nk = 1\n# 2nd\n"},
        {"[s]\nPORT = 1\n", {{"s", "port", "2"}, {"S", "Host", "h"}}, "[s]\nPORT = 2\nHost = h\n"},
        {"k\nk = 1\nempty =\nk = 2\n", {}, "k = 1\n"},
        {"# EDITED BY TESSALINE: x\nk = 1\n# Edited by Tessaline\n", {}, "k = 1\n"},
        {"# c\nk = 1\n\n[s]\nj = 2\n", {{"defaults", "k", nullptr}, {"s", nullptr, nullptr}}, "# c\n\n"},
        {"top = 1\n# before s\n[s]\nk = 1\n\n# before t\n[t]\nj = 1\n",
         {{"", "new", "d"}, {"s", "new", "s"}, {"t", "new", "t"}},
         "top = 1\n# before s\nnew = d\n[s]\nk = 1\n\n# before t\nnew = s\n[t]\nj = 1\nnew = t\n"},
        // A byte order mark opens the file again, before the keys drained
        // ahead of the first section line; elsewhere it is text.
        {"\xEF\xBB\xBF[main]\nport = 80\n",
         {{"main", "port", "81"}, {"", "top", "1"}},
         "\xEF\xBB\xBFtop = 1\n[main]\nport = 81\n"},
        {"k = 1\n\xEF\xBB\xBFk = 2\n", {}, "k = 1\n\xEF\xBB\xBFk = 2\n"},
        // The nameless section's header survives with its keys.
        {"[]\nk = 1\n", {}, "[]\nk = 1\n"},
        // New keys and sections in table order; empty sections never appear.
        {"",
         {{"", "k", "1"},
          {"n", "port", "1"},
          {"n", "timeout", "2"},
          {"empty", "k", "v"},
          {"empty", "k", nullptr},
          {"b", "k", "v"},
          {"a", "k", "v"}},
         "k = 1\n[a]\nk = v\n[b]\nk = v\n[n]\ntimeout = 2\nport = 1\n"},
    };
    for (const auto& row : rows) {
        EXPECT_EQ(rewrite(row.old, row.edits), row.expected) << row.old;
    }
    // Once the nameless section is gone, its old key lines go too and never
    // take a key of the current section with the same name, which would then
    // read back in another section.
    ConfigDir dir;
    rvConfig config(dir.Write("app.ini", "top = 1\n[]\nk = 1\n").c_str(), rvConfig::OpenUpdate);
    config.RemoveSection("");
    config.PutValue("k", "2", "x");
    config.Section("x", 0);
    ASSERT_EQ(config.Flush(0), 1u);
    EXPECT_EQ(body(dir.Read("app.ini")), "top = 1\n[x]\nk = 2\n");
}

TEST(RvConfigWriter, TextGoesOutUnescaped)
{
    ConfigDir dir;
    const std::string path = dir.Write("app.ini", std::string(5000, '#') + "\n");
    rvConfig config(path.c_str(), rvConfig::OpenUpdate);
    config.PutValue("k", "  padded  ", "");
    config.PutValue("empty", "", "");
    config.PutValue("long", std::string(5000, 'v').c_str(), "");
    config.PutValue("a=b", "line\nbreak", "");
    ASSERT_EQ(config.Flush(0), 1u);
    const std::string text = body(dir.Read("app.ini"));
    EXPECT_EQ(text.substr(0, 4095), std::string(4094, '#') + "\n");
    EXPECT_NE(text.find("long = " + std::string(5000, 'v') + "\n"), std::string::npos);

    rvConfig reread(path.c_str(), rvConfig::OpenRead);
    EXPECT_STREQ(reread.GetValue("k", "d", ""), "padded");
    EXPECT_STREQ(reread.GetValue("empty", "d", ""), "d");
    EXPECT_STREQ(reread.GetValue("a", "d", ""), "b = line");
    EXPECT_EQ(std::string(reread.GetValue("long", "d", "")).size(), 4094u - 7u);
}

TEST(RvConfigWriter, FlushStates)
{
    ConfigDir dir;
    const std::string path = dir.Write("app.ini", "[s]\nk = 1\n");
    rvConfig config(path.c_str(), rvConfig::OpenUpdate);
    EXPECT_EQ(config.Flush(1), 1u);  // unmodified: no file touched, still cleared
    EXPECT_EQ(dir.Read("app.ini"), "[s]\nk = 1\n");
    EXPECT_EQ(config.SectionCnt(), 0u);
    config.PutValue("k", "v", "a");
    config.PutValue("k", "v", "b");
    ASSERT_EQ(config.Flush(0), 1u);
    EXPECT_STREQ(config.Section(), "b");  // the last section written
    EXPECT_EQ(config.IsModified(), 0u);

    // No old file: default keys first and without a header, no backup.
    rvConfig::m_bBackups = 1;
    rvConfig fresh;
    fresh.ConfigName(dir.Path("fresh").c_str());
    fresh.Mode(rvConfig::OpenUpdate);
    fresh.PutValue("j", "2", "s");
    fresh.PutValue("k", "1", "");
    EXPECT_EQ(fresh.Close(1), 1u);
    rvConfig::m_bBackups = 0;
    EXPECT_EQ(body(dir.Read("fresh")), "k = 1\n[s]\nj = 2\n");
    EXPECT_FALSE(dir.Exists("fresh.bak"));
}

TEST(RvConfigWriter, BackupsNeverTakeTheFilesOwnName)
{
    const struct {
        const char* name;
        const char* backup;
    } rows[] = {
        {"app.ini", "app.bak"}, {"app.new", "app.bak"},       {"app.bak", "app.bak.bak"},
        {"new", "new.bak"},     {"a\\b.ini", "a\\b.ini.bak"},  // not "a/b.bak", in another directory
    };
    rvConfig::m_bBackups = 1;
    for (const auto& row : rows) {
        SCOPED_TRACE(row.name);
        ConfigDir dir;
        rvConfig config(dir.Write(row.name, "k = 1\n").c_str(), rvConfig::OpenUpdate);
        for (const char* value : {"2", "3"}) {
            config.PutValue("k", value, "");
            EXPECT_EQ(config.Flush(0), 1u);
        }
        EXPECT_EQ(body(dir.Read(row.name)), "k = 3\n");
        EXPECT_EQ(body(dir.Read(row.backup)), "k = 2\n");  // the file before the last write
    }
    rvConfig::m_bBackups = 0;
}

TEST(RvConfigWriter, RefusalsLeaveEverything)
{
    ConfigDir dir;
    const std::string path = dir.Write("app.ini", "k = 1\n");
    rvConfig unnamed;
    unnamed.Mode(rvConfig::OpenUpdate);
    unnamed.PutValue("k", "2", "");
    EXPECT_EQ(unnamed.Flush(1), 0u);
    rvConfig config(path.c_str(), rvConfig::OpenRead);
    config.PutValue("k", "2", "");
    EXPECT_EQ(config.Flush(1), 0u);
    config.Mode(rvConfig::OpenUpdate);
    {
        tessaline::testing::ScopedSysCalls calls(tessaline::config::Sys());
        tessaline::config::Sys().access = [](const char* path, int mode) {
            return mode == W_OK ? (errno = EACCES, -1) : access(path, mode);
        };
        EXPECT_EQ(config.Flush(1), 0u);
    }
    EXPECT_EQ(dir.Read("app.ini"), "k = 1\n");
    EXPECT_EQ(config.IsModified(), 1u);
    EXPECT_EQ(config.Close(1), 1u);
    EXPECT_EQ(body(dir.Read("app.ini")), "k = 2\n");

    // A name of 4095 characters is kept cut to 4094, which names another
    // file: Flush neither creates nor replaces anything.
    const std::string deep = dir.Deep(4089);
    const std::string longName = deep + "/a.cfg";
    std::ofstream(longName) << "k = 1\n";
    rvConfig cut(longName.c_str(), rvConfig::OpenUpdate);
    cut.PutValue("k", "2", "");
    EXPECT_EQ(cut.Flush(0), 0u);
    EXPECT_EQ(cut.IsModified(), 1u);
    const auto listing = std::filesystem::directory_iterator(deep);
    EXPECT_EQ(std::distance(begin(listing), end(listing)), 1);
    EXPECT_EQ(dir.Read(longName.substr(dir.path().size() + 1)), "k = 1\n");
}

}  // namespace
