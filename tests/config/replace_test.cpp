// Replacing the file on disk: every failure the platform can give, and a
// directory that someone else can write to.
#include <cerrno>
#include <climits>
#include <cstring>
#include <string>
#include <utility>
#include <vector>

#include <fcntl.h>
#include <linux/fs.h>
#include <signal.h>
#include <sys/ioctl.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <unistd.h>

#include <gtest/gtest.h>

#include "config/sys.h"
#include "config/temp_dir.h"
#include "config/written_text.h"
#include "support/capture_stderr.h"
#include "support/scoped_sys_calls.h"
#include "tessaline/config/rvConfig.h"
#include "util/sys.h"

namespace {

using tessaline::config::Sys;
using tessaline::config::SysCalls;
using tessaline::test::body;
using tessaline::test::ConfigDir;
using tessaline::testing::ScopedSysCalls;

// Large enough that a limit of kFileSizeLimit bytes stops the write.
std::string oldText(const char* value)
{
    std::string text = "# kept through every rewrite\n";
    for (int i = 0; i < 128; ++i) {
        text += "# padding line " + std::to_string(i) + "\n";
    }
    return text + "k = " + value + "\n";
}

constexpr rlim_t kFileSizeLimit = 1024;

bool endsWith(const char* text, const char* tail)
{
    const std::size_t length = std::strlen(text);
    return length >= std::strlen(tail) && std::strcmp(text + length - std::strlen(tail), tail) == 0;
}

const SysCalls kReal = Sys();

int Fail(int error)
{
    errno = error;
    return -1;
}

// Counted per flush: the first rename, the one over the old file, fails.
int g_renames = 0;

int FirstRenameFails(const char* from, const char* to)
{
    return g_renames++ == 0 ? Fail(EBUSY) : kReal.rename(from, to);
}

int TempFileRenameFails(const char* from, const char* to)
{
    return endsWith(from, ".new") ? Fail(EIO) : kReal.rename(from, to);
}

void FullDisk(SysCalls& sys)
{
    sys.fwrite = [](const void*, size_t, size_t, FILE*) -> size_t {
        errno = ENOSPC;
        return 0;
    };
}

// A failure that the platform really gives, set up for one flush.
enum class RealFault { None, FileSizeLimit, ReadOnlyDirectory, BackupIsDirectory };

class RealFaultScope {
public:
    RealFaultScope(RealFault fault, const ConfigDir& dir) : m_fault(fault), m_dir(dir)
    {
        switch (fault) {
        case RealFault::None:
            break;
        case RealFault::FileSizeLimit: {
            // Writes past the limit fail with EFBIG instead of killing us.
            m_oldSignal = signal(SIGXFSZ, SIG_IGN);
            getrlimit(RLIMIT_FSIZE, &m_oldLimit);
            rlimit limit = m_oldLimit;
            limit.rlim_cur = kFileSizeLimit;
            m_applied = setrlimit(RLIMIT_FSIZE, &limit) == 0;
            break;
        }
        case RealFault::ReadOnlyDirectory:
            chmod(dir.Path("").c_str(), 0555);
            // Modes do not stop a privileged user; the immutable flag does.
            m_applied = access(dir.Path("").c_str(), W_OK) != 0 || setImmutable(true);
            break;
        case RealFault::BackupIsDirectory:
            m_applied = mkdir(dir.Path("app.bak").c_str(), 0755) == 0 && !dir.Write("app.bak/occupied", "x").empty() &&
                        dir.Exists("app.bak/occupied");
            break;
        }
    }

    ~RealFaultScope()
    {
        switch (m_fault) {
        case RealFault::FileSizeLimit:
            setrlimit(RLIMIT_FSIZE, &m_oldLimit);
            signal(SIGXFSZ, m_oldSignal);
            break;
        case RealFault::ReadOnlyDirectory:
            setImmutable(false);
            chmod(m_dir.Path("").c_str(), 0700);
            break;
        default:
            break;
        }
    }

    RealFaultScope(const RealFaultScope&) = delete;
    RealFaultScope& operator=(const RealFaultScope&) = delete;

    // False when this process cannot bring the fault about.
    bool Applied() const { return m_applied; }

private:
    bool setImmutable(bool on) const
    {
        const int fd = open(m_dir.Path("").c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
        if (fd < 0) {
            return false;
        }
        int flags = 0;
        bool done = ioctl(fd, FS_IOC_GETFLAGS, &flags) == 0;
        flags = on ? (flags | FS_IMMUTABLE_FL) : (flags & ~FS_IMMUTABLE_FL);
        done = done && ioctl(fd, FS_IOC_SETFLAGS, &flags) == 0;
        close(fd);
        return done;
    }

    RealFault m_fault;
    const ConfigDir& m_dir;
    bool m_applied = true;
    rlimit m_oldLimit{};
    sighandler_t m_oldSignal = SIG_DFL;
};

enum class Content { Absent, Old, New, Unchecked };

struct FaultCase {
    const char* what;
    unsigned int backups;
    void (*fault)(SysCalls& sys);
    RealFault real;
    unsigned int result;
    // "{ini}", "{new}" stand for the paths of the file and the temporary file.
    const char* messages;
    Content file;
    Content backup;
    Content temp;
};

std::string expand(std::string text, const ConfigDir& dir)
{
    for (const auto& [mark, name] : {std::pair<std::string, std::string>{"{ini}", "app.ini"}, {"{new}", "app.new"}}) {
        for (std::size_t at = text.find(mark); at != std::string::npos; at = text.find(mark)) {
            text.replace(at, mark.size(), dir.Path(name));
        }
    }
    return text;
}

void expectContent(const ConfigDir& dir, const char* name, Content expected)
{
    SCOPED_TRACE(name);
    switch (expected) {
    case Content::Absent:
        EXPECT_FALSE(dir.Exists(name));
        break;
    case Content::Old:
        EXPECT_EQ(dir.Read(name), oldText("1"));  // byte for byte
        break;
    case Content::New:
        EXPECT_EQ(body(dir.Read(name)), oldText("2"));
        break;
    case Content::Unchecked:
        break;
    }
}

TEST(RvConfigReplace, EveryFaultKeepsTheData)
{
    const FaultCase cases[] = {
        {"full disk", 0, FullDisk, RealFault::None, 0, "", Content::Old, Content::Absent, Content::Absent},
        {"full disk, backups on", 1, FullDisk, RealFault::None, 0, "", Content::Old, Content::Absent, Content::Absent},
        {"fsync fails", 0, [](SysCalls& sys) { sys.fsync = [](int) { return Fail(EIO); }; }, RealFault::None, 0, "",
         Content::Old, Content::Absent, Content::Absent},
        {"close fails", 0,
         [](SysCalls& sys) {
             sys.fclose = [](FILE* stream) {
                 kReal.fclose(stream);
                 return Fail(EIO);
             };
         },
         RealFault::None, 0, "", Content::Old, Content::Absent, Content::Absent},
        {"file size limit", 0, nullptr, RealFault::FileSizeLimit, 0, "", Content::Old, Content::Absent,
         Content::Absent},
        {"read-only directory", 1, nullptr, RealFault::ReadOnlyDirectory, 0, "", Content::Old, Content::Absent,
         Content::Absent},
        // The rename over the old file fails: the plain steps take over.
        {"rename over the file fails", 0, [](SysCalls& sys) { sys.rename = FirstRenameFails; }, RealFault::None, 1, "",
         Content::New, Content::Absent, Content::Absent},
        {"rename over and unlink fail", 0,
         [](SysCalls& sys) {
             sys.rename = FirstRenameFails;
             sys.unlink = [](const char* path) { return endsWith(path, ".ini") ? Fail(EPERM) : kReal.unlink(path); };
         },
         RealFault::None, 1, "rvConfig: unlink({ini}) failed: Operation not permitted (1).", Content::New,
         Content::Absent, Content::Absent},
        // Without backups the temporary file then holds the only copy.
        {"every rename fails", 0,
         [](SysCalls& sys) { sys.rename = [](const char*, const char*) { return Fail(EIO); }; }, RealFault::None, 0,
         "rvConfig: rename({new}, {ini}) failed: Input/output error (5).", Content::Absent, Content::Absent,
         Content::New},
        {"the temporary file cannot move, backups on", 1, [](SysCalls& sys) { sys.rename = TempFileRenameFails; },
         RealFault::None, 0, "rvConfig: rename({new}, {ini}) failed: Input/output error (5).", Content::Absent,
         Content::Old, Content::Absent},
        {"the temporary file can neither move nor go", 1,
         [](SysCalls& sys) {
             sys.rename = TempFileRenameFails;
             // Only once written: the writer clears the name before it creates the file.
             sys.unlink = [](const char* path) {
                 return endsWith(path, ".new") && access(path, F_OK) == 0 ? Fail(EIO) : kReal.unlink(path);
             };
         },
         RealFault::None, 0,
         "rvConfig: rename({new}, {ini}) failed: Input/output error (5)."
         "rvConfig: unlink({new}) failed: Input/output error (5).",
         Content::Absent, Content::Old, Content::New},
        // Merging only the lines before the error would lose the rest.
        {"read error in the old file", 0,
         [](SysCalls& sys) {
             sys.fgets = [](char* line, int size, FILE* stream) -> char* {
                 return std::ftell(stream) > 0 ? (errno = EIO, nullptr) : kReal.fgets(line, size, stream);
             };
             sys.ferror = [](FILE*) { return 1; };
         },
         RealFault::None, 0, "", Content::Old, Content::Absent, Content::Absent},
        // A file system without hard links: the backup is made by rename.
        {"no hard links", 1, [](SysCalls& sys) { sys.link = [](const char*, const char*) { return Fail(EPERM); }; },
         RealFault::None, 1, "", Content::New, Content::Old, Content::Absent},
        {"backup name is a directory", 1, nullptr, RealFault::BackupIsDirectory, 0,
         "Error creating backup config file {ini}: Is a directory\n", Content::New, Content::Unchecked,
         Content::Absent},
    };
    for (const FaultCase& row : cases) {
        SCOPED_TRACE(row.what);
        ConfigDir dir;
        rvConfig config(dir.Write("app.ini", oldText("1")).c_str(), rvConfig::OpenUpdate);
        config.PutValue("k", "2", "");
        rvConfig::m_bBackups = row.backups;
        unsigned int result;
        std::string messages;
        {
            RealFaultScope fault(row.real, dir);
            if (!fault.Applied()) {
                std::printf("%s: not possible for this process, skipped\n", row.what);
                continue;
            }
            ScopedSysCalls calls(Sys());
            ScopedSysCalls noPauses(tessaline::util::Sys());
            tessaline::util::Sys().nanosleep = [](const timespec*, timespec*) { return 0; };
            g_renames = 0;
            if (row.fault != nullptr) {
                row.fault(Sys());
            }
            tessaline::test::CaptureStderr capture;
            result = config.Flush(0);
            messages = capture.Text();
        }
        rvConfig::m_bBackups = 0;
        EXPECT_EQ(result, row.result);
        EXPECT_EQ(messages, expand(row.messages, dir));
        EXPECT_EQ(config.IsModified(), result == 0 ? 1u : 0u);
        expectContent(dir, "app.ini", row.file);
        expectContent(dir, "app.bak", row.backup);
        expectContent(dir, "app.new", row.temp);
    }
}

TEST(RvConfigReplace, NothingIsWrittenThroughAPlantedTemporaryName)
{
    const struct {
        const char* what;
        int (*plant)(const char* target, const char* at);
    } plants[] = {
        {"symbolic link", [](const char* target, const char* at) { return symlink(target, at); }},
        {"hard link", [](const char* target, const char* at) { return link(target, at); }},
    };
    for (const auto& plant : plants) {
        SCOPED_TRACE(plant.what);
        ConfigDir dir;
        ConfigDir elsewhere;
        const std::string victim = elsewhere.Write("victim", "not yours\n");
        const std::string temp = dir.Path("app.new");
        ASSERT_EQ(plant.plant(victim.c_str(), temp.c_str()), 0);
        rvConfig config(dir.Write("app.ini", oldText("1")).c_str(), rvConfig::OpenUpdate);
        config.PutValue("k", "2", "");
        EXPECT_EQ(config.Flush(0), 1u);
        EXPECT_EQ(elsewhere.Read("victim"), "not yours\n");
        EXPECT_EQ(body(dir.Read("app.ini")), oldText("2"));
        EXPECT_FALSE(dir.Exists("app.new"));
    }
    {
        // A dangling link must not make the writer create its target.
        ConfigDir dir;
        ConfigDir elsewhere;
        ASSERT_EQ(symlink(elsewhere.Path("created").c_str(), dir.Path("app.new").c_str()), 0);
        rvConfig config(dir.Write("app.ini", oldText("1")).c_str(), rvConfig::OpenUpdate);
        config.PutValue("k", "2", "");
        EXPECT_EQ(config.Flush(0), 1u);
        EXPECT_FALSE(elsewhere.Exists("created"));
        EXPECT_EQ(body(dir.Read("app.ini")), oldText("2"));
    }
}

std::string linkText(const std::string& path)
{
    char text[PATH_MAX];
    const ssize_t length = readlink(path.c_str(), text, sizeof text);
    return length < 0 ? "(no link)" : std::string(text, static_cast<std::size_t>(length));
}

int g_pauses = 0;

TEST(RvConfigReplace, LinksLeadToTheFileAtTheirEnd)
{
    const struct {
        const char* what;
        // Link names and texts; "{dir}" is the directory's path, "{deep}" a
        // directory below it that leaves room for a name of seven characters
        // and no more.
        std::vector<std::pair<std::string, std::string>> links;
        std::string end;  // the file at the end of the chain
        bool exists;
        unsigned int result;
        int pauses;
    } rows[] = {
        {"link", {{"app.ini", "conf/app.ini"}}, "conf/app.ini", true, 1, 0},
        {"chain", {{"app.ini", "{dir}/conf/mid"}, {"conf/mid", "../real/app.ini"}}, "real/app.ini", true, 1, 0},
        {"dangling", {{"app.ini", "conf/mid"}, {"conf/mid", "../real/app.ini"}}, "real/app.ini", false, 1, 0},
        {"loop", {{"app.ini", "conf/mid"}, {"conf/mid", "../app.ini"}}, "app.ini", false, 0, 0},
        {"no room for side files", {{"app.ini", "{dir}/{deep}/appfile"}}, "{deep}/appfile", true, 0, 0},
        // Creating any file fails, as in a directory that is not writable.
        {"target directory not writable", {{"app.ini", "conf/app.ini"}}, "conf/app.ini", true, 0, 3},
    };
    rvConfig::m_bBackups = 1;
    for (const auto& row : rows) {
        SCOPED_TRACE(row.what);
        ConfigDir dir;
        ASSERT_EQ(mkdir(dir.Path("conf").c_str(), 0700), 0);
        ASSERT_EQ(mkdir(dir.Path("real").c_str(), 0700), 0);
        const std::string deep = row.end.find("{deep}") == 0 ? dir.Deep(4087).substr(dir.path().size() + 1) : "";
        const auto expand = [&dir, &deep](std::string text) {
            for (const auto& [mark, path] :
                 {std::pair<std::string, std::string>{"{dir}", dir.path()}, {"{deep}", deep}}) {
                const std::size_t at = text.find(mark);
                if (at != std::string::npos) {
                    text.replace(at, mark.size(), path);
                }
            }
            return text;
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
        {
            ScopedSysCalls calls(Sys());
            ScopedSysCalls pauses(tessaline::util::Sys());
            g_pauses = 0;
            tessaline::util::Sys().nanosleep = [](const timespec*, timespec*) { return ++g_pauses, 0; };
            if (row.pauses != 0) {
                Sys().open = [](const char* path, int flags, mode_t mode) {
                    return (flags & O_CREAT) != 0 ? Fail(EACCES) : kReal.open(path, flags, mode);
                };
            }
            EXPECT_EQ(config.Flush(0), row.result);
        }
        EXPECT_EQ(g_pauses, row.pauses);
        EXPECT_STREQ(config.ConfigName(), dir.Path("app.ini").c_str());
        for (const auto& [name, text] : row.links) {
            EXPECT_EQ(linkText(dir.Path(name)), expand(text)) << name;
        }
        EXPECT_FALSE(dir.Exists("app.new") || dir.Exists("app.bak") || dir.Exists(stem + ".new"));
        if (row.result == 0) {
            EXPECT_EQ(dir.Read(end), row.exists ? oldText("1") : "");
            EXPECT_FALSE(dir.Exists(stem + ".bak"));
        } else {
            EXPECT_EQ(body(dir.Read(end)), row.exists ? oldText("2") : "k = 2\n");
            EXPECT_EQ(dir.Read(stem + ".bak"), row.exists ? oldText("1") : "");
        }
    }
    rvConfig::m_bBackups = 0;
}

TEST(RvConfigReplace, RootKeepsTheOwnerWhereItMay)
{
    if (geteuid() != 0) {
        GTEST_SKIP() << "only root can give a file to another user";
    }
    constexpr uid_t kOwner = 4242;
    constexpr gid_t kGroup = 4343;
    for (const bool refused : {false, true}) {
        SCOPED_TRACE(refused ? "refused" : "permitted");
        ConfigDir dir;
        const std::string path = dir.Write("app.ini", oldText("1"));
        ASSERT_EQ(chown(path.c_str(), kOwner, kGroup), 0);
        ASSERT_EQ(chmod(path.c_str(), 0640), 0);
        rvConfig config(path.c_str(), rvConfig::OpenUpdate);
        config.PutValue("k", "2", "");
        {
            ScopedSysCalls calls(Sys());
            if (refused) {
                Sys().fchown = [](int, uid_t, gid_t) { return Fail(EPERM); };
            }
            EXPECT_EQ(config.Flush(0), 1u);
        }
        struct stat status;
        ASSERT_EQ(stat(path.c_str(), &status), 0);
        EXPECT_EQ(status.st_uid, refused ? 0 : kOwner);
        EXPECT_EQ(status.st_gid, refused ? getegid() : kGroup);
        EXPECT_EQ(status.st_mode & 07777, 0640u);
    }
}

mode_t modeOf(const std::string& path)
{
    struct stat status;
    EXPECT_EQ(stat(path.c_str(), &status), 0) << path;
    return status.st_mode & 07777;
}

TEST(RvConfigReplace, RewrittenFileKeepsItsPermissions)
{
    const struct {
        int oldMode;  // -1: no old file
        mode_t umask;
        mode_t expected;
    } rows[] = {
        {0600, 022, 0600},                   // a file kept from others stays so
        {0660, 022, 0660},                   // the old bits, not those the umask would give
        {0644, 077, 0644}, {-1, 027, 0640},  // a new file: as fopen makes it
        {-1, 0, 0666},
    };
    for (unsigned int backups : {0u, 1u}) {
        for (const auto& row : rows) {
            SCOPED_TRACE(std::to_string(row.oldMode) + " backups " + std::to_string(backups));
            ConfigDir dir;
            const std::string path = dir.Path("app.ini");
            if (row.oldMode >= 0) {
                dir.Write("app.ini", oldText("1"));
                ASSERT_EQ(chmod(path.c_str(), static_cast<mode_t>(row.oldMode)), 0);
            }
            const mode_t saved = umask(row.umask);
            rvConfig config;
            config.ConfigName(path.c_str());
            config.Mode(rvConfig::OpenUpdate);
            config.PutValue("k", "2", "");
            rvConfig::m_bBackups = backups;
            EXPECT_EQ(config.Flush(0), 1u);
            rvConfig::m_bBackups = 0;
            umask(saved);
            EXPECT_EQ(modeOf(path), row.expected);
            if (backups != 0 && row.oldMode >= 0) {
                EXPECT_EQ(modeOf(dir.Path("app.bak")), static_cast<mode_t>(row.oldMode));
            }
        }
    }
}

}  // namespace
