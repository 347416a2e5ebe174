// Saving: the merge of table and old file, side files, links, and what each
// failure leaves on disk and in memory.
#include <cerrno>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <initializer_list>
#include <string>
#include <utility>
#include <vector>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <gtest/gtest.h>

#include "config/side_name.h"
#include "config/sys.h"
#include "config/temp_dir.h"
#include "support/capture_stderr.h"
#include "support/closed_stdin.h"
#include "support/scoped_sys_calls.h"
#include "tessaline/config/rvConfig.h"
#include "util/sys.h"

namespace {

using tessaline::config::Sys;
using tessaline::config::SysCalls;
using tessaline::test::body;
using tessaline::test::ConfigDir;
using tessaline::testing::ScopedSysCalls;

std::string oldText(const char* value)
{
    return std::string("# kept through every rewrite\nk = ") + value + "\n";
}

const SysCalls kReal = Sys();

int Fail(int error)
{
    errno = error;
    return -1;
}

int g_pauses = 0;

// While it lives: pauses return at once and are counted.
struct FaultScope {
    FaultScope()
    {
        tessaline::util::Sys().nanosleep = [](const timespec*, timespec*) { return ++g_pauses, 0; };
    }
    ScopedSysCalls<SysCalls> calls{Sys()};
    ScopedSysCalls<tessaline::util::SysCalls> pauses{tessaline::util::Sys()};
};

int CreateFails(const char* path, int flags, mode_t mode)
{
    return (flags & O_CREAT) != 0 ? Fail(EACCES) : kReal.open(path, flags, mode);
}

// Counted per flush: the first rename, the one over the old file, fails.
int g_renames = 0;

int RenameOverTheFileFails(const char* from, const char* to)
{
    return g_renames++ == 0 ? Fail(EBUSY) : kReal.rename(from, to);
}

int TempFileRenameFails(const char* from, const char* to)
{
    return std::strstr(from, ".new") != nullptr ? Fail(EIO) : kReal.rename(from, to);
}

// What app.ini, app.bak and app.new hold afterwards, in this order: O the
// old text byte for byte, N the new text, - nothing.
void expectContents(const ConfigDir& dir, const char* contents)
{
    const char* names[] = {"app.ini", "app.bak", "app.new"};
    for (int i = 0; i < 3; ++i) {
        SCOPED_TRACE(names[i]);
        if (contents[i] == '-') {
            EXPECT_FALSE(dir.Exists(names[i]));
        } else if (contents[i] == 'O') {
            EXPECT_EQ(dir.Read(names[i]), oldText("1"));
        } else if (contents[i] == 'N') {
            EXPECT_EQ(body(dir.Read(names[i])), oldText("2"));
        }
    }
}

TEST(RvConfigReplace, EveryFaultKeepsTheData)
{
    const struct {
        const char* what;
        unsigned int backups;
        void (*fault)(SysCalls& sys);
        unsigned int result;
        const char* messages;  // "{ini}", "{new}": the paths of app.ini and app.new
        const char* contents;
        int pauses;
    } cases[] = {
        {"full disk", 0,
         [](SysCalls& sys) {
             sys.fwrite = [](const void*, size_t, size_t, FILE*) { return errno = ENOSPC, size_t{0}; };
         },
         0, "", "O--", 0},
        {"file size limit, backups on", 1, [](SysCalls& sys) { sys.fflush = [](FILE*) { return Fail(EFBIG); }; }, 0, "",
         "O--", 0},
        {"fsync fails", 0, [](SysCalls& sys) { sys.fsync = [](int) { return Fail(EIO); }; }, 0, "", "O--", 0},
        {"close fails", 0, [](SysCalls& sys) { sys.fclose = [](FILE* file) { return kReal.fclose(file), Fail(EIO); }; },
         0, "", "O--", 0},
        {"directory not writable", 1, [](SysCalls& sys) { sys.open = CreateFails; }, 0, "", "O--", 3},
        {"file not writable", 0,
         [](SysCalls& sys) {
             sys.access = [](const char* path, int mode) {
                 return mode == W_OK ? Fail(EACCES) : kReal.access(path, mode);
             };
         },
         0, "", "O--", 0},
        // Merging only the lines before the error would lose the rest.
        {"read error in the old file", 0,
         [](SysCalls& sys) {
             sys.fgets = [](char* line, int size, FILE* stream) -> char* {
                 return std::ftell(stream) > 0 ? (errno = EIO, nullptr) : kReal.fgets(line, size, stream);
             };
             sys.ferror = [](FILE*) { return 1; };
         },
         0, "", "O--", 0},
        // The rename over the old file fails: the plain steps take over.
        {"rename over the file fails", 0, [](SysCalls& sys) { sys.rename = RenameOverTheFileFails; }, 1, "", "N--", 0},
        {"rename over and unlink fail", 0,
         [](SysCalls& sys) {
             sys.rename = RenameOverTheFileFails;
             sys.unlink = [](const char* path) {
                 return std::strstr(path, ".ini") != nullptr ? Fail(EPERM) : kReal.unlink(path);
             };
         },
         1, "rvConfig: unlink({ini}) failed: Operation not permitted (1).", "N--", 0},
        // Without backups the temporary file then holds the only copy.
        {"every rename fails", 0,
         [](SysCalls& sys) { sys.rename = [](const char*, const char*) { return Fail(EIO); }; }, 0,
         "rvConfig: rename({new}, {ini}) failed: Input/output error (5).", "--N", 0},
        {"the temporary file cannot move, backups on", 1, [](SysCalls& sys) { sys.rename = TempFileRenameFails; }, 0,
         "rvConfig: rename({new}, {ini}) failed: Input/output error (5).", "-O-", 0},
        {"the temporary file can neither move nor go", 1,
         [](SysCalls& sys) {
             sys.rename = TempFileRenameFails;
             // Only once written: the writer clears the name before it creates the file.
             sys.unlink = [](const char* path) {
                 return std::strstr(path, ".new") != nullptr && access(path, F_OK) == 0 ? Fail(EIO)
                                                                                        : kReal.unlink(path);
             };
         },
         0,
         "rvConfig: rename({new}, {ini}) failed: Input/output error (5)."
         "rvConfig: unlink({new}) failed: Input/output error (5).",
         "-ON", 0},
        // A file system without hard links: the backup is made by rename.
        {"no hard links", 1, [](SysCalls& sys) { sys.link = [](const char*, const char*) { return Fail(EPERM); }; }, 1,
         "", "NO-", 0},
        {"backup name is a directory", 1,
         [](SysCalls& sys) {
             sys.link = [](const char*, const char*) { return Fail(EEXIST); };
             sys.rename = [](const char* from, const char* to) {
                 return std::strstr(to, ".bak") != nullptr ? Fail(EISDIR) : kReal.rename(from, to);
             };
         },
         0, "Error creating backup config file {ini}: Is a directory\n", "N--", 0},
    };
    for (const auto& row : cases) {
        SCOPED_TRACE(row.what);
        ConfigDir dir;
        rvConfig config(dir.Write("app.ini", oldText("1")).c_str(), rvConfig::OpenUpdate);
        config.PutValue("k", "2", "");
        rvConfig::m_bBackups = row.backups;
        unsigned int result;
        std::string messages;
        g_pauses = 0;
        g_renames = 0;
        {
            FaultScope scope;
            row.fault(Sys());
            tessaline::test::CaptureStderr capture;
            result = config.Flush(0);
            messages = capture.Text();
        }
        rvConfig::m_bBackups = 0;
        EXPECT_EQ(result, row.result);
        std::string expected = row.messages;
        for (const char* name : {"app.ini", "app.new"}) {
            const std::string mark = std::string("{") + (name + 4) + "}";
            for (std::size_t at = expected.find(mark); at != std::string::npos; at = expected.find(mark)) {
                expected.replace(at, mark.size(), dir.Path(name));
            }
        }
        EXPECT_EQ(messages, expected);
        EXPECT_EQ(g_pauses, row.pauses);
        EXPECT_EQ(config.IsModified(), result == 0 ? 1u : 0u);
        expectContents(dir, row.contents);
    }
}

TEST(RvConfigReplace, NothingIsWrittenThroughAPlantedTemporaryName)
{
    const struct {
        const char* what;
        bool hard;
        const char* target;  // in another directory
    } plants[] = {{"symbolic link", false, "victim"}, {"hard link", true, "victim"}, {"dangling link", false, "new"}};
    for (const auto& plant : plants) {
        SCOPED_TRACE(plant.what);
        ConfigDir dir;
        ConfigDir elsewhere;
        elsewhere.Write("victim", "not yours\n");
        const std::string target = elsewhere.Path(plant.target);
        const std::string temp = dir.Path("app.new");
        ASSERT_EQ(plant.hard ? link(target.c_str(), temp.c_str()) : symlink(target.c_str(), temp.c_str()), 0);
        rvConfig config(dir.Write("app.ini", oldText("1")).c_str(), rvConfig::OpenUpdate);
        config.PutValue("k", "2", "");
        EXPECT_EQ(config.Flush(0), 1u);
        EXPECT_EQ(elsewhere.Read("victim"), "not yours\n");
        EXPECT_FALSE(elsewhere.Exists("new"));
        EXPECT_EQ(body(dir.Read("app.ini")), oldText("2"));
        EXPECT_FALSE(dir.Exists("app.new"));
    }
}

TEST(RvConfigReplace, LinksLeadToTheFileAtTheirEnd)
{
    const struct {
        const char* what;
        // Link names and texts; "{deep}" is a directory that leaves room for
        // a name of seven characters and no more.
        std::vector<std::pair<std::string, std::string>> links;
        std::string end;  // the file at the end of the chain
        bool exists;
        unsigned int result;
    } rows[] = {
        {"link", {{"app.ini", "conf/app.ini"}}, "conf/app.ini", true, 1},
        {"chain", {{"app.ini", "conf/mid"}, {"conf/mid", "../real/app.ini"}}, "real/app.ini", true, 1},
        {"dangling", {{"app.ini", "conf/mid"}, {"conf/mid", "../real/app.ini"}}, "real/app.ini", false, 1},
        {"loop", {{"app.ini", "conf/mid"}, {"conf/mid", "../app.ini"}}, "app.ini", false, 0},
        {"no room for side files", {{"app.ini", "{deep}/appfile"}}, "{deep}/appfile", true, 0},
    };
    rvConfig::m_bBackups = 1;
    for (const auto& row : rows) {
        SCOPED_TRACE(row.what);
        ConfigDir dir;
        ASSERT_EQ(mkdir(dir.Path("conf").c_str(), 0700), 0);
        ASSERT_EQ(mkdir(dir.Path("real").c_str(), 0700), 0);
        const std::string deep = row.end.find("{deep}") == 0 ? dir.Deep(4087).substr(dir.path().size() + 1) : "";
        const auto expand = [&deep](std::string text) {
            return text.find("{deep}") != 0 ? text : text.replace(0, 6, deep);
        };
        for (const auto& [name, text] : row.links) {
            ASSERT_EQ(symlink(expand(text).c_str(), dir.Path(name).c_str()), 0);
        }
        const std::string end = expand(row.end);
        const std::string stem = end.substr(0, end.find(".ini"));
        if (row.exists) {
            dir.Write(end, oldText("1"));
        }
        rvConfig config;
        config.ConfigName(dir.Path("app.ini").c_str());
        config.Mode(rvConfig::OpenUpdate);
        config.PutValue("k", "2", "");
        EXPECT_EQ(config.Flush(0), row.result);
        EXPECT_STREQ(config.ConfigName(), dir.Path("app.ini").c_str());
        for (const auto& [name, text] : row.links) {
            EXPECT_EQ(std::filesystem::read_symlink(dir.Path(name)), expand(text)) << name;
        }
        EXPECT_FALSE(dir.Exists("app.new") || dir.Exists("app.bak") || dir.Exists(stem + ".new"));
        EXPECT_EQ(dir.Exists(stem + ".bak"), row.result == 1 && row.exists);
        if (row.result == 0) {
            EXPECT_EQ(dir.Read(end), row.exists ? oldText("1") : "");
        } else {
            EXPECT_EQ(body(dir.Read(end)), row.exists ? oldText("2") : "k = 2\n");
            EXPECT_EQ(dir.Read(stem + ".bak"), row.exists ? oldText("1") : "");
        }
    }
    rvConfig::m_bBackups = 0;
}

// A rewritten file keeps its mode, and its owner where the process may give
// it away (as root); a new file gets the mode of a fresh fopen.
TEST(RvConfigReplace, RewrittenFileKeepsModeAndOwner)
{
    const bool root = geteuid() == 0;
    const struct {
        int oldMode;  // -1: no old file
        mode_t umask;
        mode_t expected;
        bool ownerRefused;
    } rows[] = {
        {0600, 022, 0600, false},  // a file kept from others stays so
        {0664, 077, 0664, true},   // the old bits, not those the umask would give
        {-1, 027, 0640, false},
    };
    rvConfig::m_bBackups = 1;
    for (const auto& row : rows) {
        SCOPED_TRACE(row.oldMode);
        ConfigDir dir;
        const std::string path = dir.Path("app.ini");
        if (row.oldMode >= 0) {
            dir.Write("app.ini", oldText("1"));
            ASSERT_EQ(chmod(path.c_str(), mode_t(row.oldMode)), 0);
            ASSERT_TRUE(!root || chown(path.c_str(), 4242, 4343) == 0);
        }
        const mode_t saved = umask(row.umask);
        rvConfig config;
        config.ConfigName(path.c_str());
        config.Mode(rvConfig::OpenUpdate);
        config.PutValue("k", "2", "");
        {
            ScopedSysCalls calls(Sys());
            if (row.ownerRefused) {
                Sys().fchown = [](int, uid_t, gid_t) { return Fail(EPERM); };
            }
            EXPECT_EQ(config.Flush(0), 1u);
        }
        umask(saved);
        struct stat status;
        ASSERT_EQ(stat(path.c_str(), &status), 0);
        EXPECT_EQ(status.st_mode & 07777, row.expected);
        if (root && row.oldMode >= 0) {
            EXPECT_EQ(status.st_uid, row.ownerRefused ? 0u : 4242u);
            EXPECT_EQ(status.st_gid, row.ownerRefused ? getegid() : 4343u);
        }
        if (row.oldMode >= 0) {
            ASSERT_EQ(stat(dir.Path("app.bak").c_str(), &status), 0);
            EXPECT_EQ(status.st_mode & 07777, mode_t(row.oldMode));
        }
    }
    rvConfig::m_bBackups = 0;
}

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

std::vector<ino_t> g_syncedDirectories;

// The renames reach the disk through one sync of the directory, also for a
// host that closed its standard input, whose descriptor the directory gets.
TEST(RvConfigWriter, FlushSyncsTheDirectoryOnce)
{
    ConfigDir dir;
    rvConfig config(dir.Write("app.ini", "k = 1\n").c_str(), rvConfig::OpenUpdate);
    config.PutValue("k", "2", "");
    struct stat directory;
    ASSERT_EQ(stat(dir.path().c_str(), &directory), 0);
    ScopedSysCalls<SysCalls> calls(Sys());
    Sys().fsync = [](int fd) {
        struct stat info;
        if (fstat(fd, &info) == 0 && S_ISDIR(info.st_mode)) {
            g_syncedDirectories.push_back(info.st_ino);
        }
        return kReal.fsync(fd);
    };
    {
        tessaline::test::ClosedStdin closed;
        EXPECT_EQ(config.Flush(0), 1u);
    }
    EXPECT_EQ(g_syncedDirectories, std::vector<ino_t>{directory.st_ino});
}

// Whatever the name, and even with an odd extension, a side file is the
// name with its extension replaced or one added, beside it, never the file.
TEST(RvConfigWriter, SideFilesStayBesideTheFile)
{
    for (const std::string name : {"app.ini", "d.d/app", "a.b.c", "x.", "a\\b.ini", "a//\\", "?/", "\\"}) {
        for (const char* ext : {"bak", "\\", ""}) {
            const std::string side = tessaline::config::SideFileName(name, ext);
            const std::size_t file = name.rfind('/') + 1;
            const std::size_t dot = name.rfind('.');
            const std::string replaced =
                name.substr(0, dot != std::string::npos && dot >= file ? dot : std::string::npos);
            EXPECT_TRUE(side != name && (side == replaced + "." + ext || side == name + "." + ext))
                << name << " with " << ext << ": " << side;
        }
    }
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
