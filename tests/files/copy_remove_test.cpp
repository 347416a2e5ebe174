// Copying, moving, linking, removing and comparing files and trees.
#include <climits>

#include "files/file_fixtures.h"
#include "files/sys.h"
#include "support/capture_stderr.h"
#include "support/closed_stdin.h"
#include "support/scoped_sys_calls.h"
#include "tessaline/files/rvCopy.h"

using namespace tessaline::test;
using tessaline::files::Sys;
namespace fs = std::filesystem;

namespace {

const tessaline::files::SysCalls kReal = Sys();

int Copy(const std::string& source, const std::string& target, unsigned recurse, unsigned overwrite, unsigned link = 0,
         unsigned move = 0)
{
    return rvCopyFile(source.c_str(), target.c_str(), recurse, overwrite, link, move, nullptr, nullptr, 0640);
}

// Four files, one of them two levels down with a newline in its name.
void MakeSourceTree(const TempDir& dir)
{
    Put(dir / "src/one.txt", "one");
    Put(dir / "src/two.dat", "second");
    Put(dir / "src/sub/three.txt", "three");
    Put(dir / "src/sub/deep/four\nname", "4");
}

std::string CouldNotRemove(const std::string& path, int error)
{
    return "rvUnlink: Could not remove " + path + ": " + std::strerror(error) + " (" + std::to_string(error) + ").\n";
}

}  // namespace

TEST(CopyFile, SingleFilesAndTheOverwriteRules)
{
    TempDir dir;
    const std::string source = Put(dir / "source", "new!");
    const mode_t oldMask = umask(022);
    EXPECT_EQ(1, Copy(source, dir / "new/dir/copy", 0, 1)) << "parents are made";
    umask(oldMask);
    EXPECT_EQ(fs::perms(0640), fs::status(dir / "new/dir/copy").permissions());
    EXPECT_EQ(0, Copy(dir / "missing", dir / "made/x", 0, 1));
    EXPECT_EQ(0, Copy(source, dir.path(), 0, 1)) << "a directory is no single-file target";
    EXPECT_EQ(0, rvCopyFile(nullptr, "x", 0, 1, 0, 0, nullptr, nullptr, 0644));

    const std::string target = Put(dir / "target", "old.");
    fs::last_write_time(target, fs::last_write_time(source));
    EXPECT_EQ(0, Copy(source, target, 0, 0)) << "same time and size count as up to date";
    EXPECT_EQ("old.", Slurp(target));
    fs::last_write_time(target, fs::last_write_time(source) + std::chrono::hours(1));
    EXPECT_EQ(1, Copy(source, target, 0, 0));
    EXPECT_EQ(1, Copy(source, dir / "fresh", 0, 0)) << "created exclusively";
    Put(dir / "longer", "longer old content");
    EXPECT_EQ(1, Copy(source, dir / "longer", 0, 2)) << "2 truncates";
    EXPECT_EQ(0, Copy(source, dir / "nodir/x", 0, 2)) << "but makes no directories";
    EXPECT_EQ((std::set<std::string>{"new/", "new/dir/", "new/dir/copy=new!", "source=new!", "target=new!",
                                     "fresh=new!", "longer=new!"}),
              Tree(dir.path()));

    // Onto itself, by any name, the file stays as it is.
    link(source.c_str(), (dir / "hard").c_str());
    symlink(source.c_str(), (dir / "soft").c_str());
    for (const std::string& self : {source, dir / "./source", dir / "hard", dir / "soft"}) {
        EXPECT_EQ(0, Copy(source, self, 0, 1)) << self;
    }
    EXPECT_EQ(0, Copy(dir / "*", dir.path(), 0, 1));
    EXPECT_EQ("new!", Slurp(source));
}

TEST(CopyFile, LinksMovesAndRefusedSchemes)
{
    TempDir dir;
    const std::string source = Put(dir / "source", "text");
    EXPECT_EQ(1, Copy(source, dir / "link", 0, 1, 1));
    EXPECT_EQ(source, fs::read_symlink(dir / "link"));
    EXPECT_EQ(0, Copy(source, dir / "link", 0, 1, 1)) << "an existing target fails";

    MakeSourceTree(dir);
    EXPECT_EQ(1, Copy(dir / "src/*", dir / "dirlink/", 0, 1, 1)) << "one link for the directory";
    EXPECT_EQ(dir / "src", fs::read_symlink(dir / "dirlink"));
    // Without the slash the directory link is tried on the parent, fails, and
    // the files are linked one by one.
    EXPECT_EQ(2, Copy(dir / "src/*", dir / "links", 0, 1, 1));
    EXPECT_EQ(dir / "src/two.dat", fs::read_symlink(dir / "links/two.dat"));

    EXPECT_EQ(4, Copy(dir / "src", dir / "moved", 1, 1, 0, 1));
    EXPECT_EQ((std::set<std::string>{"sub/", "sub/deep/"}), Tree(dir / "src")) << "source directories stay";

    Put(dir / "ftp:/host/a.txt", "remote?");
    Put(dir / "file:/host/a.txt", "local");
    ScopedCwd cwd(dir.path());
    EXPECT_EQ(0, Copy("ftp://host/a.txt", "./out", 0, 1));
    EXPECT_EQ(0, Copy("HTTP://host/a.txt", "./out", 0, 1));
    EXPECT_EQ(1, Copy("file://host/a.txt", "./out", 0, 1));
}

TEST(CopyFile, WildcardsAndTrees)
{
    TempDir dir;
    MakeSourceTree(dir);
    EXPECT_EQ(1, Copy(dir / "src/*.txt", dir / "texts", 0, 1));
    EXPECT_EQ(2, Copy(dir / "src", dir / "flat", 0, 1)) << "recurse 0 skips directories";
    EXPECT_EQ(4, Copy(dir / "src/", dir / "full", 1, 1));
    EXPECT_EQ(Tree(dir / "src"), Tree(dir / "full"));
    EXPECT_EQ(0, Copy(dir / "src/*.none", dir / "nomatch", 0, 1)) << "the target directory is made anyway";
    EXPECT_EQ((std::set<std::string>{"one.txt=one", "two.dat=second"}), Tree(dir / "flat"));
    EXPECT_EQ((std::set<std::string>{"one.txt=one"}), Tree(dir / "texts"));

    Put(dir / "file", "x");
    symlink((dir / "gone").c_str(), (dir / "dangling").c_str());
    for (const std::string& bad : {dir / "file/inner", dir / "dangling", dir / "missing/*"}) {
        EXPECT_EQ(0, Copy(bad, dir / "out", 1, 1)) << bad;
    }
    EXPECT_EQ(0, Copy(dir / "file", dir / "file/inner", 0, 1)) << "a target through a file";

    ScopedCwd cwd(dir.path());
    EXPECT_EQ(0, Copy("src", dir / "bare", 1, 1)) << "a bare directory name walks nothing";
    EXPECT_EQ(4, Copy("./src", dir / "dotted", 1, 1));
    EXPECT_TRUE(Exists("nomatch"));
}

TEST(Unlink, FilesTreesWildcardsAndLinks)
{
    TempDir dir;
    CaptureStderr capture;
    EXPECT_EQ(0, rvUnlink((dir / "missing").c_str(), 1));
    const std::string readOnly = Put(dir / "read only", "x");
    chmod(readOnly.c_str(), 0444);
    EXPECT_EQ(1, rvUnlink(readOnly.c_str(), 0));
    EXPECT_FALSE(Exists(readOnly));

    Put(dir / "t/a.txt", "1");
    Put(dir / "t/b.log", "2");
    Put(dir / "t/sub/c d", "3");
    Put(dir / "t/sub/deeper/new\nline", "4");
    EXPECT_EQ(0, rvUnlink((dir / "t").c_str(), 0)) << "a directory needs recurse 1";
    EXPECT_EQ(1, rvUnlink((dir / "t/*.txt").c_str(), 0));
    EXPECT_EQ(1, rvUnlink((dir / "t/*").c_str(), 0));
    EXPECT_TRUE(Exists(dir / "t/sub")) << "recurse 0 leaves directories";
    EXPECT_EQ(2, rvUnlink((dir / "t/*").c_str(), 1));
    EXPECT_TRUE(Exists(dir / "t")) << "the directory of the pattern stays";
    EXPECT_EQ(0, rvUnlink((dir / "t").c_str(), 1)) << "an empty directory counts nothing";
    EXPECT_FALSE(Exists(dir / "t"));
    Put(dir / "rel/sub/f", "1");
    {
        ScopedCwd cwd(dir.path());
        EXPECT_EQ(1, rvUnlink("rel", 1));
    }
    EXPECT_FALSE(Exists(dir / "rel")) << "a tree named relative to the working directory";

    // A link to a directory goes as a link; a dangling one fails the
    // existence test, which follows links, and stays in silence.
    Put(dir / "real/kept", "keep");
    symlink((dir / "real").c_str(), (dir / "to-dir").c_str());
    symlink((dir / "gone").c_str(), (dir / "dangling").c_str());
    EXPECT_EQ(0, rvUnlink((dir / "to-dir").c_str(), 1));
    EXPECT_EQ(0, rvUnlink((dir / "dangling").c_str(), 1));
    EXPECT_FALSE(Exists(dir / "to-dir"));
    EXPECT_TRUE(Exists(dir / "real/kept") && Exists(dir / "dangling"));

    // A member listed as a directory that is a file by the time it is
    // entered goes as a file.
    Put(dir / "swapped/x", "1");
    tessaline::testing::ScopedSysCalls restore(Sys());
    Sys().readdir = [](DIR* directory) {
        dirent* entry = kReal.readdir(directory);
        if (entry != nullptr && std::strcmp(entry->d_name, "x") == 0) {
            entry->d_type = DT_DIR;
        }
        return entry;
    };
    EXPECT_EQ(0, rvUnlink((dir / "swapped").c_str(), 1));
    EXPECT_FALSE(Exists(dir / "swapped"));
    Sys().readdir = kReal.readdir;

    // A member that cannot go is reported and skipped.
    Put(dir / "t/stuck", "1");
    Put(dir / "t/free", "2");
    Sys().unlinkat = [](int directory, const char* name, int flags) {
        errno = EACCES;
        return std::strcmp(name, "stuck") == 0 ? -1 : kReal.unlinkat(directory, name, flags);
    };
    EXPECT_EQ(1, rvUnlink((dir / "t").c_str(), 1));
    EXPECT_EQ((std::set<std::string>{"stuck=1"}), Tree(dir / "t"));
    EXPECT_EQ(CouldNotRemove(dir / "t", EISDIR) + CouldNotRemove(dir / "t/stuck", EACCES), capture.Text());
}

std::set<int> g_held;  // the directory descriptors a walk holds
size_t g_mostHeld = 0;
std::string g_decoy;   // where ".." leads
int g_checks = 0;      // fstat calls so far
int g_checksThatWork;  // after these, fstat fills its answer but fails

// A walk holds at most 32 directories open. On the way up it takes ".."
// only where that is still the level above (here it never is), else reopens
// each upper level by name, and uses it only once it has checked that it is
// still the directory it left.
TEST(Unlink, DeepTreesWhereDotDotLeadsElsewhere)
{
    for (const bool checksFail : {false, true}) {
        TempDir dir;
        std::string path = dir / "t";
        for (int level = 0; level < 40; ++level, path += "/d") {
            Put(path + "/f", "x");
        }
        g_decoy = dir / "decoy";
        fs::create_directories(g_decoy + "/d");
        g_checks = 0;
        g_checksThatWork = checksFail ? 40 : INT_MAX;  // one for each level on the way down
        tessaline::testing::ScopedSysCalls restore(Sys());
        Sys().openat = [](int at, const char* name, int flags, mode_t mode) {
            if (std::strcmp(name, "..") == 0) {
                return kReal.openat(AT_FDCWD, g_decoy.c_str(), flags, mode);
            }
            const int fd = kReal.openat(at, name, flags, mode);
            if (fd >= 0 && (flags & O_DIRECTORY) != 0 && std::strcmp(name, ".") != 0) {
                g_held.insert(fd);
                g_mostHeld = std::max(g_mostHeld, g_held.size());
            }
            return fd;
        };
        Sys().close = [](int fd) { return g_held.erase(fd), kReal.close(fd); };
        Sys().fstat = [](int fd, struct stat* info) {
            const int result = kReal.fstat(fd, info);
            return ++g_checks > g_checksThatWork ? (errno = EIO, -1) : result;
        };
        const int removed = rvUnlink((dir / "t").c_str(), 1);
        EXPECT_TRUE(Exists(g_decoy + "/d"));
        if (checksFail) {
            EXPECT_TRUE(Exists(dir / "t/d")) << "a level that cannot be checked again is left alone";
        } else {
            EXPECT_EQ(40, removed);
            EXPECT_FALSE(Exists(dir / "t"));
            EXPECT_EQ(32u, g_mostHeld);
        }
    }
}

TEST(Sizes, TreesCompareOneWayAndFilesBySize)
{
    TempDir dir;
    Put(dir / "a/one", "123");
    Put(dir / "a/sub/two", "45");
    Put(dir / "b/one", "abc");
    Put(dir / "b/sub/two", "de");
    Put(dir / "b/extra", "only in b");
    const std::string a = dir / "a";
    const std::string b = dir / "b";
    EXPECT_EQ(1, CompareDirectoriesByFileSize(a.c_str(), b.c_str())) << "sizes, not contents";
    {
        ClosedStdin closed;
        EXPECT_EQ(1, CompareDirectoriesByFileSize(a.c_str(), b.c_str())) << "a directory on descriptor 0";
    }
    EXPECT_EQ(0, CompareDirectoriesByFileSize(b.c_str(), a.c_str())) << "one-way";
    EXPECT_EQ(1, CompareDirectoriesByFileSize((dir.path() + "\\a").c_str(), (dir.path() + "\\b\\").c_str()))
        << "backslashes separate as slashes do";
    EXPECT_EQ(1, CompareDirectoriesByFileSize((dir / "none").c_str(), b.c_str()));
    EXPECT_EQ(0, CompareDirectoriesByFileSize(a.c_str(), (dir / "none").c_str()));
    Put(dir / "b/sub/two", "longer");
    EXPECT_EQ(0, CompareDirectoriesByFileSize(a.c_str(), b.c_str())) << "a deeper size differs";
    Put(dir / "b/sub/two", "de");
    fs::create_directory_symlink("sub", dir / "a/linked");
    Put(dir / "b/linked/two", "..");
    EXPECT_EQ(1, CompareDirectoriesByFileSize(a.c_str(), b.c_str())) << "through a link to a directory";
    // A directory never matches a file, not even one of the directory's size.
    fs::create_directory(dir / "a/kind");
    struct stat kind;
    ASSERT_EQ(0, stat((dir / "a/kind").c_str(), &kind));
    Put(dir / "b/kind", std::string(static_cast<size_t>(kind.st_size), '.'));
    EXPECT_EQ(0, CompareDirectoriesByFileSize(a.c_str(), b.c_str())) << "directory against file";
    fs::remove(dir / "b/extra");
    EXPECT_EQ(0, CompareDirectoriesByFileSize(b.c_str(), a.c_str())) << "file against directory";

    EXPECT_EQ(2, rvGetFileSize((dir.path() + "\\b\\sub\\two").c_str())) << "backslashes";
    EXPECT_EQ(0, rvGetFileSize((dir / "none").c_str()));
    const int fd = open((dir / "a/one").c_str(), O_RDONLY | O_CLOEXEC);
    EXPECT_EQ(3, rvGetFileSize64(reinterpret_cast<void*>(static_cast<intptr_t>(fd))));
    close(fd);
    EXPECT_EQ(-1, rvGetFileSize64(reinterpret_cast<void*>(static_cast<intptr_t>(-1))));
}
