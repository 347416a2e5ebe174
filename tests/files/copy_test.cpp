#include <cerrno>
#include <string>

#include <sys/stat.h>
#include <unistd.h>
#include <utime.h>

#include <gtest/gtest.h>

#include "files/sys.h"
#include "files/temp_tree.h"
#include "tessaline/files/rvCopy.h"

using tessaline::files::ScopedSysCalls;
using tessaline::files::Sys;
using tessaline::test::Exists;
using tessaline::test::ReadAll;
using tessaline::test::ScopedCwd;
using tessaline::test::TempTree;

namespace {

// rvCopyFile with the common arguments filled in.
int Copy(const std::string& source, const std::string& target, unsigned recurse,
         unsigned overwrite, unsigned link = 0, unsigned move = 0)
{
    return rvCopyFile(source.c_str(), target.c_str(), recurse, overwrite, link, move, nullptr,
                      nullptr, 0644);
}

void SetTime(const std::string& path, time_t when)
{
    struct utimbuf times = {when, when};
    utime(path.c_str(), &times);
}

mode_t Mode(const std::string& path)
{
    struct stat info;
    stat(path.c_str(), &info);
    return info.st_mode & 07777;
}

// A source tree: two files at the top, one in a sub-directory, one deeper.
void MakeSourceTree(const TempTree& tree)
{
    tree.Write("src/one.txt", "one");
    tree.Write("src/two.dat", "second file");
    tree.Write("src/sub/three.txt", "three");
    tree.Write("src/sub/deep/four name\nwith newline", "4");
}

// Makes the n-th read of the copy loop behave as `result` says (0 for an
// early end, -1 for a failure); the reads before it are real.
struct ReadScript {
    static inline int calls = 0;
    static inline int failAt = 0;
    static inline ssize_t result = 0;

    static void Install(int at, ssize_t outcome)
    {
        calls = 0;
        failAt = at;
        result = outcome;
        static const auto realRead = Sys().read;
        Sys().read = [](int fd, void* buffer, size_t count) -> ssize_t {
            if (++calls == failAt) {
                errno = EIO;
                return result;
            }
            return realRead(fd, buffer, count);
        };
    }
};

}  // namespace

TEST(CopyFile, SingleFile)
{
    TempTree tree;
    const std::string source = tree.Write("source.txt", "payload");
    const mode_t oldMask = umask(022);

    EXPECT_EQ(1, Copy(source, tree.Path("new/dir/copy.txt"), 0, 1)) << "parents are made";
    EXPECT_EQ("payload", ReadAll(tree.Path("new/dir/copy.txt")));
    EXPECT_EQ(static_cast<mode_t>(0644), Mode(tree.Path("new/dir/copy.txt")));
    EXPECT_EQ("payload", ReadAll(source));

    EXPECT_EQ(1, Copy(tree.Write("empty", ""), tree.Path("empty.copy"), 0, 1));
    EXPECT_EQ("", ReadAll(tree.Path("empty.copy")));

    const std::string big(100000, 'z');
    EXPECT_EQ(1, Copy(tree.Write("big", big), tree.Path("big.copy"), 0, 1));
    EXPECT_EQ(big, ReadAll(tree.Path("big.copy"))) << "several passes of the buffer";

    EXPECT_EQ(0, Copy(tree.Path("missing"), tree.Path("made/x"), 0, 1));
    EXPECT_FALSE(Exists(tree.Path("made"))) << "a missing source makes nothing";

    EXPECT_EQ(0, Copy(source, tree.Root(), 0, 1)) << "a directory is no single-way target";
    EXPECT_EQ(0, Copy(source, "copy.txt", 0, 1)) << "a bare name has no directory to make";
    EXPECT_FALSE(Exists("copy.txt"));
    umask(oldMask);
}

TEST(CopyFile, OverwriteRules)
{
    TempTree tree;
    const std::string source = tree.Write("source.txt", "new!");
    const std::string target = tree.Write("target.txt", "old.");
    SetTime(source, 1000000);
    SetTime(target, 1000000);

    EXPECT_EQ(0, Copy(source, target, 0, 0)) << "same time and size: up to date";
    EXPECT_EQ("old.", ReadAll(target));

    SetTime(target, 2000000);
    EXPECT_EQ(1, Copy(source, target, 0, 0)) << "a differing time replaces";
    EXPECT_EQ("new!", ReadAll(target));
    EXPECT_EQ(1, Copy(source, target, 0, 0)) << "the copy has a new time, so again";

    EXPECT_EQ(1, Copy(source, tree.Path("fresh.txt"), 0, 0)) << "created exclusively";
    EXPECT_EQ("new!", ReadAll(tree.Path("fresh.txt")));

    tree.Write("longer.txt", "much longer old content");
    EXPECT_EQ(1, Copy(source, tree.Path("longer.txt"), 0, 2)) << "overwrite 2 truncates";
    EXPECT_EQ("new!", ReadAll(tree.Path("longer.txt")));
    {
        ScopedSysCalls restore;
        Sys().nanosleep = [](const struct timespec*, struct timespec*) { return 0; };
        EXPECT_EQ(0, Copy(source, tree.Path("nodir/x.txt"), 0, 2)) << "but makes no directories";
        EXPECT_FALSE(Exists(tree.Path("nodir")));
    }
}

TEST(CopyFile, OntoItselfLeavesTheFileAlone)
{
    TempTree tree;
    const std::string source = tree.Write("dir/self.txt", "precious");
    link(source.c_str(), tree.Path("hard.txt").c_str());
    symlink(source.c_str(), tree.Path("soft.txt").c_str());
    for (const std::string& target : {source, tree.Path("dir/./self.txt"), tree.Path("hard.txt"),
                                      tree.Path("soft.txt")}) {
        SCOPED_TRACE(target);
        EXPECT_EQ(0, Copy(source, target, 0, 1));
        EXPECT_EQ(0, Copy(source, target, 0, 2));
        EXPECT_EQ("precious", ReadAll(source));
    }
    EXPECT_EQ(0, Copy(tree.Path("dir/*"), tree.Path("dir"), 0, 1));
    EXPECT_EQ("precious", ReadAll(source));
}

TEST(CopyFile, FailedCopyRemovesTheTargetOnly)
{
    TempTree tree;
    const std::string source = tree.Write("source.bin", std::string(50000, 's'));
    const std::string target = tree.Write("target.bin", "older target");
    const struct {
        const char* what;
        int readAt;
        ssize_t result;
    } cases[] = {
        {"the source ends early", 2, 0},
        {"a read fails", 3, -1},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.what);
        tree.Write("target.bin", "older target");
        ScopedSysCalls restore;
        ReadScript::Install(c.readAt, c.result);
        EXPECT_EQ(0, Copy(source, target, 0, 1, 0, 1));
        EXPECT_FALSE(Exists(target));
        EXPECT_EQ(50000u, ReadAll(source).size()) << "a failed move keeps the source";
    }
    {
        ScopedSysCalls restore;
        Sys().write = [](int, const void*, size_t) -> ssize_t {
            errno = ENOSPC;
            return -1;
        };
        EXPECT_EQ(0, Copy(source, target, 0, 1));
        EXPECT_FALSE(Exists(target));
    }
    {
        ScopedSysCalls restore;
        static int closes;
        closes = 0;
        static const auto realClose = Sys().close;
        Sys().close = [](int fd) {
            realClose(fd);
            if (++closes == 2) {
                errno = EIO;
                return -1;
            }
            return 0;
        };
        EXPECT_EQ(0, Copy(source, target, 0, 1)) << "a target that fails to close";
        EXPECT_FALSE(Exists(target));
    }
}

TEST(CopyFile, RefusedSchemes)
{
    TempTree tree;
    tree.Write("ftp:/host/a.txt", "remote?");
    tree.Write("HTTP:/host/a.txt", "remote?");
    tree.Write("file:/host/a.txt", "local");
    ScopedCwd cwd(tree.Root());
    EXPECT_EQ(0, Copy("ftp://host/a.txt", "./out1.txt", 0, 1));
    EXPECT_EQ(0, Copy("HTTP://host/a.txt", "./out2.txt", 0, 1));
    EXPECT_EQ(0, Copy("ftp://elsewhere/a.txt", "./out3.txt", 0, 1));
    EXPECT_FALSE(Exists("out1.txt") || Exists("out2.txt") || Exists("out3.txt"));
    EXPECT_EQ(1, Copy("file://host/a.txt", "./out4.txt", 0, 1));
    EXPECT_EQ("local", ReadAll("out4.txt"));
}

TEST(CopyFile, LinksAndMoves)
{
    TempTree tree;
    const std::string source = tree.Write("source.txt", "text");
    EXPECT_EQ(1, Copy(source, tree.Path("link.txt"), 0, 1, 1));
    char buffer[4096] = {};
    ASSERT_GT(readlink(tree.Path("link.txt").c_str(), buffer, sizeof buffer - 1), 0);
    EXPECT_EQ(source, buffer);
    EXPECT_EQ(0, Copy(source, tree.Path("link.txt"), 0, 1, 1)) << "an existing target fails";

    EXPECT_EQ(1, Copy(source, tree.Path("moved.txt"), 0, 1, 0, 1));
    EXPECT_FALSE(Exists(source));
    EXPECT_EQ("text", ReadAll(tree.Path("moved.txt")));

    MakeSourceTree(tree);
    EXPECT_EQ(1, Copy(tree.Path("src/*"), tree.Path("dirlink/"), 0, 1, 1)) << "one link for all";
    EXPECT_EQ("one", ReadAll(tree.Path("dirlink/one.txt")));
    // Without the slash the directory link is tried on the parent, fails, and
    // the files are linked one by one.
    EXPECT_EQ(2, Copy(tree.Path("src/*"), tree.Path("links"), 0, 1, 1));
    char member[4096] = {};
    ASSERT_GT(readlink(tree.Path("links/two.dat").c_str(), member, sizeof member - 1), 0);
    EXPECT_EQ(tree.Path("src/two.dat"), member);

    EXPECT_EQ(4, Copy(tree.Path("src"), tree.Path("moved"), 1, 1, 0, 1));
    EXPECT_EQ("4", ReadAll(tree.Path("moved/sub/deep/four name\nwith newline")));
    EXPECT_TRUE(Exists(tree.Path("src/sub/deep"))) << "source directories stay";
    EXPECT_FALSE(Exists(tree.Path("src/one.txt")));
    EXPECT_FALSE(Exists(tree.Path("src/sub/deep/four name\nwith newline")));
}

TEST(CopyFile, WildcardsAndTrees)
{
    TempTree tree;
    MakeSourceTree(tree);

    EXPECT_EQ(1, Copy(tree.Path("src/*.txt"), tree.Path("texts"), 0, 1));
    EXPECT_EQ("one", ReadAll(tree.Path("texts/one.txt")));

    EXPECT_EQ(2, Copy(tree.Path("src"), tree.Path("flat"), 0, 1)) << "recurse 0 skips sub";
    EXPECT_FALSE(Exists(tree.Path("flat/sub")));

    EXPECT_EQ(4, Copy(tree.Path("src/"), tree.Path("full"), 1, 1));
    EXPECT_EQ(1, CompareDirectoriesByFileSize(tree.Path("src").c_str(), tree.Path("full").c_str()));

    EXPECT_EQ(0, Copy(tree.Path("src/*.none"), tree.Path("nomatch"), 0, 1));
    EXPECT_TRUE(Exists(tree.Path("nomatch"))) << "the target directory is made anyway";

    tree.MakeDir("empty");
    EXPECT_EQ(0, Copy(tree.Path("empty"), tree.Path("empty.copy"), 1, 1));
    EXPECT_TRUE(Exists(tree.Path("empty.copy")));

    ScopedCwd cwd(tree.Root());
    EXPECT_EQ(0, Copy("src", tree.Path("bare"), 1, 1)) << "a bare directory name walks nothing";
    EXPECT_EQ(4, Copy("./src", tree.Path("dotted"), 1, 1));
}

TEST(CopyFile, BadInput)
{
    TempTree tree;
    const std::string file = tree.Write("file.txt", "x");
    symlink(tree.Path("gone").c_str(), tree.Path("dangling").c_str());
    EXPECT_EQ(0, Copy(tree.Path("file.txt/inner"), tree.Path("out"), 1, 1));
    EXPECT_EQ(0, Copy(tree.Path("dangling"), tree.Path("out"), 1, 1));
    EXPECT_EQ(0, Copy(file, tree.Path("file.txt/inner"), 0, 1)) << "a target through a file";
    EXPECT_EQ(0, rvCopyFile(nullptr, "x", 0, 1, 0, 0, nullptr, nullptr, 0644));
    EXPECT_EQ(0, rvCopyFile(file.c_str(), nullptr, 0, 1, 0, 0, nullptr, nullptr, 0644));
    EXPECT_FALSE(Exists(tree.Path("out")));
}
