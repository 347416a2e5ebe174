// Saving: the merge of table and old file, the side files, and what each
// failure leaves on disk and in memory.
#include <cerrno>
#include <regex>
#include <string>

#include <gtest/gtest.h>

#include "config/sys_seam.h"
#include "config/temp_dir.h"
#include "support/capture_stderr.h"
#include "tessaline/config/rvConfig.h"

namespace {

using tessaline::config::testing::SetFaultHook;
using tessaline::config::testing::SysCall;
using tessaline::test::CaptureStderr;
using tessaline::test::TempDir;

// The file without its identification line, which must be the last line
// and the only one.
std::string body(const std::string& text)
{
    static const std::regex idLine("# Edited by Tessaline: [A-Z][a-z]+ [0-9]{2}, [0-9]{4} - [0-9]{2}:[0-9]{2}:[0-9]{2}\n$");
    std::smatch match;
    EXPECT_TRUE(std::regex_search(text, match, idLine)) << text;
    const std::string rest = text.substr(0, text.size() - match.length());
    EXPECT_EQ(rest.find("Edited by"), std::string::npos) << text;
    return rest;
}

// Loads `content` for update, lets `change` work on it, flushes and
// returns the new file without its identification line.
template <typename Change>
std::string rewrite(const std::string& content, Change change)
{
    TempDir dir;
    const std::string path = dir.Write("app.ini", content);
    rvConfig config(path.c_str(), rvConfig::OpenUpdate);
    change(config);
    config.IsModified(1);
    EXPECT_EQ(config.Flush(0), 1u);
    EXPECT_FALSE(dir.Exists("app.new"));
    return body(dir.Read("app.ini"));
}

// Seam plans for the fault tests.
SysCall g_failingCall;
int g_failingErrno;
int failChosenCall(SysCall call, const char*)
{
    return call == g_failingCall ? g_failingErrno : 0;
}

class FailCall {
public:
    FailCall(SysCall call, int error)
    {
        g_failingCall = call;
        g_failingErrno = error;
        SetFaultHook(failChosenCall);
    }
    ~FailCall() { SetFaultHook(nullptr); }
};

TEST(RvConfigWriter, WorkedCaseLineForLine)
{
    const std::string old = "# comment\n"
                            "a = 1\n"
                            "\n"
                            "[s1]\n"
                            "b = 2\n"
                            "c = 3\n"
                            "# second comment\n"
                            "[s2]\n"
                            "d = 4\n"
                            "# Edited by Tessaline: January 01, 2020 - 00:00:00\n";
    EXPECT_EQ(rewrite(old,
                      [](rvConfig& config) {
                          config.PutValue("e", "5", "");
                          config.PutValue("b", "22", "s1");
                          config.PutValue("f", "6", "s1");
                          config.RemoveKey("s1", "c");
                          config.PutValue("g", "7", "s3");
                      }),
              "# comment\n"
              "a = 1\n"
              "\n"
              "e = 5\n"
              "[s1]\n"
              "b = 22\n"
              "# second comment\n"
              "f = 6\n"
              "[s2]\n"
              "d = 4\n"
              "[s3]\n"
              "g = 7\n");
}

TEST(RvConfigWriter, LayoutSurvives)
{
    // Unchanged content: same lines, written in the writer's own form.
    EXPECT_EQ(rewrite("  # indented\r\n \t \r\n[Net]\nPort=\"80\"\n\n;tail\n", [](rvConfig&) {}),
              "  # indented\n \t \r\n[Net]\nPort = 80\n\n;tail\n");
    // A removed section loses its header and keys and keeps its comments.
    EXPECT_EQ(rewrite("[a]\n# about a\nk = 1\n[b]\nj = 2\n", [](rvConfig& c) { c.RemoveSection("a"); }),
              "# about a\n[b]\nj = 2\n");
    // Two blocks of one section: keys gather in the first, comments stay.
    EXPECT_EQ(rewrite("[s]\nx = 1\n[t]\nk = 1\n[S]\n# second block\ny = 2\nx = 3\n", [](rvConfig&) {}),
              "[s]\nx = 1\ny = 2\n[t]\nk = 1\n# second block\n");
    // Consecutive headers of one section both stay when keys follow.
    EXPECT_EQ(rewrite("[s]\n[S]\nk = 1\n", [](rvConfig&) {}), "[s]\n[S]\nk = 1\n");
    // The file's spelling of a key stays; the table's goes to new lines.
    EXPECT_EQ(rewrite("[s]\nPORT = 1\n", [](rvConfig& c) {
                  c.PutValue("port", "2", "s");
                  c.PutValue("Host", "h", "S");
              }),
              "[s]\nPORT = 2\nHost = h\n");
    // Lines that stored nothing, and a second line for one key, go.
    EXPECT_EQ(rewrite("k\nk = 1\nempty =\nk = 2\n", [](rvConfig&) {}), "k = 1\n");
    // Any number of identification lines, in any case, give one.
    EXPECT_EQ(rewrite("# EDITED BY TESSALINE: x\nk = 1\n# Edited by Tessaline\n", [](rvConfig&) {}), "k = 1\n");
    // All keys removed: comments and blank lines remain.
    EXPECT_EQ(rewrite("# c\nk = 1\n\n[s]\nj = 2\n", [](rvConfig& c) {
                  c.RemoveKey("defaults", "k");
                  c.RemoveSection("s");
              }),
              "# c\n\n");
}

TEST(RvConfigWriter, NewKeysJoinTheEndOfTheirSection)
{
    EXPECT_EQ(rewrite("top = 1\n# before s\n[s]\nk = 1\n\n# before t\n[t]\nj = 1\n",
                      [](rvConfig& c) {
                          c.PutValue("new", "d", "");
                          c.PutValue("new", "s", "s");
                          c.PutValue("new", "t", "t");
                      }),
              "top = 1\n# before s\nnew = d\n[s]\nk = 1\n\n# before t\nnew = s\n[t]\nj = 1\nnew = t\n");
    // New keys and sections come in table order; empty ones never appear.
    EXPECT_EQ(rewrite("", [](rvConfig& c) {
                  c.PutValue("port", "1", "n");
                  c.PutValue("timeout", "2", "n");
                  c.Section("empty", 1);
                  c.PutValue("k", "v", "b");
                  c.PutValue("k", "v", "a");
              }),
              "[a]\nk = v\n[b]\nk = v\n[n]\ntimeout = 2\nport = 1\n");
}

TEST(RvConfigWriter, TextGoesOutUnescaped)
{
    TempDir dir;
    const std::string path = dir.Write("app.ini", std::string(5000, '#') + "\n");
    rvConfig config(path.c_str(), rvConfig::OpenUpdate);
    config.PutValue("k", "  padded  ", "");
    config.PutValue("empty", "", "");
    config.PutValue("long", std::string(5000, 'v').c_str(), "");
    config.PutValue("a=b", "line\nbreak", "");
    ASSERT_EQ(config.Flush(0), 1u);
    EXPECT_EQ(config.IsModified(), 0u);
    const std::string text = body(dir.Read("app.ini"));
    EXPECT_EQ(text.substr(0, 4095), std::string(4094, '#') + "\n");  // the rest piece is dropped
    EXPECT_NE(text.find("long = " + std::string(5000, 'v') + "\n"), std::string::npos);

    rvConfig reread(path.c_str(), rvConfig::OpenRead);
    EXPECT_STREQ(reread.GetValue("k", "d", ""), "padded");
    EXPECT_STREQ(reread.GetValue("empty", "d", ""), "d");
    EXPECT_STREQ(reread.GetValue("a", "d", ""), "b = line");
    EXPECT_EQ(std::string(reread.GetValue("long", "d", "")).size(), 4094u - 7u);
}

TEST(RvConfigWriter, FlushStates)
{
    TempDir dir;
    const std::string path = dir.Write("app.ini", "[s]\nk = 1\n");
    {
        // Nothing modified: no file is touched, bClear still empties.
        rvConfig config(path.c_str(), rvConfig::OpenUpdate);
        EXPECT_EQ(config.Flush(1), 1u);
        EXPECT_EQ(dir.Read("app.ini"), "[s]\nk = 1\n");
        EXPECT_EQ(config.SectionCnt(), 0u);
    }
    {
        // The table reads as before; the current section is the last one
        // the pass selected.
        rvConfig config(path.c_str(), rvConfig::OpenUpdate);
        for (int i = 0; i < 50; ++i) {
            config.PutValue(("key" + std::to_string(i)).c_str(), "v", ("sec" + std::to_string(i % 7)).c_str());
        }
        std::string before;
        for (const char* s = config.EnumSections(1); s != nullptr; s = config.EnumSections(0)) {
            for (const char* k = config.EnumTokens(s, 1); k != nullptr; k = config.EnumTokens(s, 0)) {
                before += std::string(s) + "/" + k + ";";
            }
        }
        const unsigned int items = config.IsValid();
        ASSERT_EQ(config.Flush(0), 1u);
        std::string after;
        for (const char* s = config.EnumSections(1); s != nullptr; s = config.EnumSections(0)) {
            for (const char* k = config.EnumTokens(s, 1); k != nullptr; k = config.EnumTokens(s, 0)) {
                after += std::string(s) + "/" + k + ";";
            }
        }
        EXPECT_EQ(after, before);
        EXPECT_EQ(config.IsValid(), items);
        EXPECT_EQ(config.IsModified(), 0u);
        EXPECT_STREQ(config.Section(), "sec6");
        EXPECT_EQ(config.m_pFile, nullptr);
    }
    {
        // No old file: default keys first, without a header; no backup.
        rvConfig::m_bBackups = 1;
        rvConfig config;
        config.ConfigName(dir.Path("fresh").c_str());
        config.Mode(rvConfig::OpenUpdate);
        config.PutValue("k", "1", "");
        config.PutValue("j", "2", "s");
        EXPECT_EQ(config.Close(1), 1u);
        rvConfig::m_bBackups = 0;
        EXPECT_EQ(body(dir.Read("fresh")), "k = 1\n[s]\nj = 2\n");
        EXPECT_FALSE(dir.Exists("fresh.bak"));
        EXPECT_FALSE(dir.Exists("fresh.new"));
    }
    {
        // OpenWrite empties the old file first: table order, no comments.
        const std::string written = dir.Write("write.ini", "# gone\nk = 1\n");
        rvConfig config(written.c_str(), rvConfig::OpenUpdate);
        config.Mode(rvConfig::OpenWrite);
        config.PutValue("k", "2", "");
        ASSERT_EQ(config.Flush(0), 1u);
        EXPECT_EQ(body(dir.Read("write.ini")), "k = 2\n");
    }
}

TEST(RvConfigWriter, Backups)
{
    TempDir dir;
    const std::string path = dir.Write("app.ini", "k = 1\n");
    rvConfig::m_bBackups = 1;
    rvConfig config(path.c_str(), rvConfig::OpenUpdate);
    EXPECT_EQ(config.CreateBackups(), 1u);
    config.PutValue("k", "2", "");
    ASSERT_EQ(config.Flush(0), 1u);
    EXPECT_EQ(dir.Read("app.bak"), "k = 1\n");
    config.PutValue("k", "3", "");
    ASSERT_EQ(config.Flush(0), 1u);
    config.CreateBackups(0);
    EXPECT_EQ(body(dir.Read("app.bak")), "k = 2\n");
    EXPECT_EQ(body(dir.Read("app.ini")), "k = 3\n");
}

TEST(RvConfigWriter, SideFilesNeverTakeTheFilesOwnName)
{
    TempDir dir;
    const struct {
        const char* name;
        const char* backup;
    } rows[] = {{"app.new", "app.bak"}, {"app.bak", "app.bak.bak"}, {"noext", "noext.bak"}, {"new", "new.bak"}};
    rvConfig::m_bBackups = 1;
    for (const auto& row : rows) {
        SCOPED_TRACE(row.name);
        const std::string path = dir.Write(row.name, "k = 1\n");
        rvConfig config(path.c_str(), rvConfig::OpenUpdate);
        config.PutValue("k", "2", "");
        EXPECT_EQ(config.Flush(0), 1u);
        EXPECT_EQ(body(dir.Read(row.name)), "k = 2\n");
        EXPECT_EQ(dir.Read(row.backup), "k = 1\n");
    }
    rvConfig::m_bBackups = 0;
}

TEST(RvConfigWriter, RefusalsLeaveEverything)
{
    TempDir dir;
    const std::string path = dir.Write("app.ini", "k = 1\n");
    rvConfig config(path.c_str(), rvConfig::OpenRead);
    config.PutValue("k", "2", "");
    EXPECT_EQ(config.Flush(1), 0u);  // read-only mode
    EXPECT_EQ(config.IsModified(), 1u);
    config.Mode(rvConfig::OpenUpdate);
    {
        FailCall unwritable(SysCall::Writable, EACCES);
        EXPECT_EQ(config.Flush(1), 0u);
    }
    EXPECT_EQ(config.Close(1), 1u);  // flushes now
    EXPECT_EQ(body(dir.Read("app.ini")), "k = 2\n");
    EXPECT_STREQ(config.GetValue("k", "d", ""), "2");
}

TEST(RvConfigWriter, FailedWritesKeepTheOldFile)
{
    const std::string old = "# keep me\nk = 1\n";
    for (SysCall call : {SysCall::Write, SysCall::Sync, SysCall::Close}) {
        TempDir dir;
        const std::string path = dir.Write("app.ini", old);
        rvConfig config(path.c_str(), rvConfig::OpenUpdate);
        config.PutValue("k", "2", "");
        CaptureStderr capture;
        {
            FailCall full(call, ENOSPC);
            EXPECT_EQ(config.Flush(1), 0u);
        }
        EXPECT_EQ(capture.Text(), "");
        EXPECT_EQ(dir.Read("app.ini"), old);
        EXPECT_FALSE(dir.Exists("app.new"));
        EXPECT_EQ(config.IsModified(), 1u);
        EXPECT_STREQ(config.GetValue("k", "d", ""), "2");
    }
}

TEST(RvConfigWriter, ReplacementMessages)
{
    {
        // Backup rename fails: message, result 0, the new file still lands.
        TempDir dir;
        const std::string path = dir.Write("app.ini", "k = 1\n");
        rvConfig::m_bBackups = 1;
        rvConfig config(path.c_str(), rvConfig::OpenUpdate);
        config.PutValue("k", "2", "");
        CaptureStderr capture;
        unsigned int result;
        {
            SetFaultHook([](SysCall call, const char* from) {
                return call == SysCall::Rename && std::string(from).find(".ini") != std::string::npos ? EXDEV : 0;
            });
            result = config.Flush(0);
            SetFaultHook(nullptr);
        }
        rvConfig::m_bBackups = 0;
        EXPECT_EQ(result, 0u);
        EXPECT_EQ(capture.Text(), "Error creating backup config file " + path + ": Invalid cross-device link\n");
        EXPECT_EQ(body(dir.Read("app.ini")), "k = 2\n");
        EXPECT_EQ(config.IsModified(), 1u);
    }
    {
        // Unlink of the old file fails: message, the rename still replaces.
        TempDir dir;
        const std::string path = dir.Write("app.ini", "k = 1\n");
        rvConfig config(path.c_str(), rvConfig::OpenUpdate);
        config.PutValue("k", "2", "");
        CaptureStderr capture;
        unsigned int result;
        {
            FailCall unlinkFails(SysCall::Unlink, EPERM);
            result = config.Flush(0);
        }
        EXPECT_EQ(result, 1u);
        EXPECT_EQ(capture.Text(), "rvConfig: unlink(" + path + ") failed: Operation not permitted (1).");
        EXPECT_EQ(body(dir.Read("app.ini")), "k = 2\n");
    }
    {
        // Last rename fails without backups: the temporary file is kept.
        TempDir dir;
        const std::string path = dir.Write("app.ini", "k = 1\n");
        rvConfig config(path.c_str(), rvConfig::OpenUpdate);
        config.PutValue("k", "2", "");
        CaptureStderr capture;
        unsigned int result;
        {
            FailCall renameFails(SysCall::Rename, EIO);
            result = config.Flush(0);
        }
        EXPECT_EQ(result, 0u);
        EXPECT_EQ(capture.Text(), "rvConfig: rename(" + dir.Path("app.new") + ", " + path +
                                      ") failed: Input/output error (5).");
        EXPECT_FALSE(dir.Exists("app.ini"));
        EXPECT_EQ(body(dir.Read("app.new")), "k = 2\n");
        EXPECT_EQ(config.IsModified(), 1u);
    }
    {
        // With backups the old file is the backup and the temporary file
        // goes; its failed removal is reported too.
        TempDir dir;
        const std::string path = dir.Write("app.ini", "k = 1\n");
        rvConfig::m_bBackups = 1;
        rvConfig config(path.c_str(), rvConfig::OpenUpdate);
        config.PutValue("k", "2", "");
        CaptureStderr capture;
        unsigned int result;
        {
            SetFaultHook([](SysCall call, const char* name) {
                const bool temp = std::string(name).find(".new") != std::string::npos;
                return (call == SysCall::Rename || call == SysCall::Unlink) && temp ? EIO : 0;
            });
            result = config.Flush(0);
            SetFaultHook(nullptr);
        }
        rvConfig::m_bBackups = 0;
        EXPECT_EQ(result, 0u);
        const std::string temp = dir.Path("app.new");
        EXPECT_EQ(capture.Text(), "rvConfig: rename(" + temp + ", " + path + ") failed: Input/output error (5)." +
                                      "rvConfig: unlink(" + temp + ") failed: Input/output error (5).");
        EXPECT_EQ(dir.Read("app.bak"), "k = 1\n");
        EXPECT_FALSE(dir.Exists("app.ini"));
    }
}

}  // namespace
