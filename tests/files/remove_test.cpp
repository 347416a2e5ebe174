#include <cerrno>
#include <cstring>
#include <string>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <gtest/gtest.h>

#include "files/sys.h"
#include "files/temp_tree.h"
#include "support/capture_stderr.h"
#include "tessaline/files/rvCopy.h"
#include "tessaline/files/rvFileApi.h"

using tessaline::files::ScopedSysCalls;
using tessaline::files::Sys;
using tessaline::test::CaptureStderr;
using tessaline::test::Exists;
using tessaline::test::TempTree;

namespace {

std::string CouldNotRemove(const std::string& path, int error)
{
    return "rvUnlink: Could not remove " + path + ": " + std::strerror(error) + " (" +
           std::to_string(error) + ").\n";
}

}  // namespace

TEST(Unlink, FilesAndDirectories)
{
    TempTree tree;
    CaptureStderr capture;

    EXPECT_EQ(0, rvUnlink(tree.Path("missing").c_str(), 1));
    EXPECT_EQ(0, rvUnlink(nullptr, 1));

    const std::string readOnly = tree.Write("read only.txt", "x");
    chmod(readOnly.c_str(), 0444);
    EXPECT_EQ(1, rvUnlink(readOnly.c_str(), 0));
    EXPECT_FALSE(Exists(readOnly));

    const std::string directory = tree.MakeDir("dir");
    EXPECT_EQ(0, rvUnlink(directory.c_str(), 0));
    EXPECT_TRUE(Exists(directory));
    EXPECT_EQ(0, rvUnlink(directory.c_str(), 1)) << "an empty directory counts nothing";
    EXPECT_FALSE(Exists(directory));

    tree.Write("tree/a", "1");
    tree.Write("tree/sub/b c", "2");
    tree.Write("tree/sub/deeper/new\nline", "3");
    EXPECT_EQ(3, rvUnlink(tree.Path("tree").c_str(), 1));
    EXPECT_FALSE(Exists(tree.Path("tree")));

    EXPECT_EQ(CouldNotRemove(directory, EISDIR), capture.Text());
}

TEST(Unlink, Wildcards)
{
    TempTree tree;
    tree.Write("x/a.txt", "1");
    tree.Write("x/b.log", "2");
    tree.Write("x/sub/c.txt", "3");

    EXPECT_EQ(1, rvUnlink(tree.Path("x/*.txt").c_str(), 0));
    EXPECT_EQ(1, rvUnlink(tree.Path("x/*").c_str(), 0));
    EXPECT_TRUE(Exists(tree.Path("x/sub/c.txt"))) << "recurse 0 leaves directories";
    EXPECT_EQ(1, rvUnlink(tree.Path("x/*").c_str(), 1));
    EXPECT_FALSE(Exists(tree.Path("x/sub")));
    EXPECT_TRUE(Exists(tree.Path("x"))) << "the directory of the pattern stays";
    EXPECT_EQ(0, rvUnlink(tree.Path("no/such/*").c_str(), 1));
}

TEST(Unlink, LinksGoAsLinks)
{
    TempTree tree;
    tree.Write("real/kept.txt", "keep");
    symlink(tree.Path("real").c_str(), tree.Path("to-dir").c_str());
    EXPECT_EQ(0, rvUnlink(tree.Path("to-dir").c_str(), 1));
    EXPECT_FALSE(Exists(tree.Path("to-dir")));
    EXPECT_TRUE(Exists(tree.Path("real/kept.txt")));

    // A dangling link fails the existence test that follows links, so it is
    // left, silently, like any missing path.
    symlink(tree.Path("gone").c_str(), tree.Path("dangling").c_str());
    CaptureStderr capture;
    EXPECT_EQ(0, rvUnlink(tree.Path("dangling").c_str(), 1));
    EXPECT_TRUE(Exists(tree.Path("dangling")));
    EXPECT_EQ("", capture.Text());
}

TEST(Unlink, FailuresAreCountedAndReported)
{
    TempTree tree;
    tree.Write("t/stuck", "1");
    tree.Write("t/free", "2");
    ScopedSysCalls restore;
    static const auto realUnlink = Sys().unlink;
    Sys().unlink = [](const char* path) {
        const std::string name = path;
        if (name.size() > 6 && name.compare(name.size() - 6, 6, "/stuck") == 0) {
            errno = EACCES;
            return -1;
        }
        return realUnlink(path);
    };
    CaptureStderr capture;
    EXPECT_EQ(1, rvUnlink(tree.Path("t").c_str(), 1));
    EXPECT_EQ(CouldNotRemove(tree.Path("t/stuck"), EACCES), capture.Text());
    EXPECT_TRUE(Exists(tree.Path("t/stuck"))) << "the directory stays, not empty";
    EXPECT_FALSE(Exists(tree.Path("t/free")));
}

TEST(CompareDirectories, SecondMustCoverFirst)
{
    TempTree tree;
    tree.Write("a/one", "123");
    tree.Write("a/sub/two", "45");
    tree.Write("b/one", "abc");
    tree.Write("b/sub/two", "de");
    tree.Write("b/extra", "only in b");
    const std::string a = tree.Path("a");
    const std::string b = tree.Path("b");

    EXPECT_EQ(1, CompareDirectoriesByFileSize(a.c_str(), b.c_str())) << "sizes, not contents";
    EXPECT_EQ(0, CompareDirectoriesByFileSize(b.c_str(), a.c_str())) << "one-way";
    EXPECT_EQ(1, CompareDirectoriesByFileSize(tree.Path("none").c_str(), b.c_str()));
    EXPECT_EQ(0, CompareDirectoriesByFileSize(a.c_str(), tree.Path("none").c_str()));

    tree.Write("b/sub/two", "longer");
    EXPECT_EQ(0, CompareDirectoriesByFileSize(a.c_str(), b.c_str())) << "a deeper size differs";
    tree.Write("b/sub/two", "de");

    tree.MakeDir("a/kind");
    tree.Write("b/kind", "");
    EXPECT_EQ(0, CompareDirectoriesByFileSize(a.c_str(), b.c_str())) << "directory against file";
}

TEST(FileSize, ByNameAndByHandle)
{
    TempTree tree;
    const std::string path = tree.Write("dir/sized.bin", std::string(1234, 'x'));
    EXPECT_EQ(1234, rvGetFileSize(path.c_str()));
    EXPECT_EQ(1234, rvGetFileSize((tree.Root() + "\\dir\\sized.bin").c_str()))
        << "backslashes are accepted";
    EXPECT_EQ(0, rvGetFileSize(tree.Path("missing").c_str()));
    EXPECT_EQ(0, rvGetFileSize(nullptr));

    const int fd = open(path.c_str(), O_RDONLY | O_CLOEXEC);
    void* handle = reinterpret_cast<void*>(static_cast<intptr_t>(fd));
    EXPECT_EQ(1234, rvGetFileSize64(handle));
    close(fd);
    EXPECT_EQ(-1, rvGetFileSize64(reinterpret_cast<void*>(static_cast<intptr_t>(-1))));
}
