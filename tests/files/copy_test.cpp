#include <string>

#include <sys/stat.h>
#include <unistd.h>
#include <utime.h>

#include <gtest/gtest.h>

#include "files/file_fixtures.h"
#include "support/temp_dir.h"
#include "tessaline/files/rvCopy.h"

using namespace tessaline::test;

namespace {

int Copy(const std::string& source, const std::string& target, unsigned recurse, unsigned overwrite, unsigned link = 0,
         unsigned move = 0)
{
    return rvCopyFile(source.c_str(), target.c_str(), recurse, overwrite, link, move, nullptr, nullptr, 0640);
}

void SetTime(const std::string& path, time_t when)
{
    const struct utimbuf times = {when, when};
    utime(path.c_str(), &times);
}

std::string LinkText(const std::string& path)
{
    char text[4096] = {};
    return readlink(path.c_str(), text, sizeof text - 1) > 0 ? text : "<no link>";
}

// Four files, one of them two levels down with a newline in its name.
void MakeSourceTree(const TempDir& dir)
{
    Put(dir / "src/one.txt", "one");
    Put(dir / "src/two.dat", "second");
    Put(dir / "src/sub/three.txt", "three");
    Put(dir / "src/sub/deep/four\nname", "4");
}

}  // namespace

TEST(CopyFile, SingleFilesAndTheOverwriteRules)
{
    TempDir dir;
    const std::string source = Put(dir / "source", "new!");
    const mode_t oldMask = umask(022);
    EXPECT_EQ(1, Copy(source, dir / "new/dir/copy", 0, 1)) << "parents are made";
    umask(oldMask);
    struct stat info;
    stat((dir / "new/dir/copy").c_str(), &info);
    EXPECT_EQ(0640u, info.st_mode & 07777);
    EXPECT_EQ(0, Copy(dir / "missing", dir / "made/x", 0, 1));
    EXPECT_EQ(0, Copy(source, dir.path(), 0, 1)) << "a directory is no single-file target";
    EXPECT_EQ(0, rvCopyFile(nullptr, "x", 0, 1, 0, 0, nullptr, nullptr, 0644));

    const std::string target = Put(dir / "target", "old.");
    SetTime(source, 1000000);
    SetTime(target, 1000000);
    EXPECT_EQ(0, Copy(source, target, 0, 0)) << "same time and size count as up to date";
    SetTime(target, 2000000);
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
    EXPECT_EQ(source, LinkText(dir / "link"));
    EXPECT_EQ(0, Copy(source, dir / "link", 0, 1, 1)) << "an existing target fails";

    MakeSourceTree(dir);
    EXPECT_EQ(1, Copy(dir / "src/*", dir / "dirlink/", 0, 1, 1)) << "one link for the directory";
    EXPECT_EQ(dir / "src", LinkText(dir / "dirlink"));
    // Without the slash the directory link is tried on the parent, fails, and
    // the files are linked one by one.
    EXPECT_EQ(2, Copy(dir / "src/*", dir / "links", 0, 1, 1));
    EXPECT_EQ(dir / "src/two.dat", LinkText(dir / "links/two.dat"));

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
