#include <cerrno>
#include <cstring>
#include <string>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <gtest/gtest.h>

#include "files/file_fixtures.h"
#include "files/member_text.h"
#include "files/sys.h"
#include "support/scoped_sys_calls.h"
#include "util/sys.h"
#include "support/capture_stderr.h"
#include "support/temp_dir.h"
#include "tessaline/files/rvCopy.h"
#include "tessaline/files/rvFilename.h"

using namespace tessaline::test;
using tessaline::files::Sys;
using tessaline::testing::ScopedSysCalls;

namespace {

std::string CouldNotRemove(const std::string& path, int error)
{
    return "rvUnlink: Could not remove " + path + ": " + std::strerror(error) + " (" + std::to_string(error) + ").\n";
}

}  // namespace

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

    // A link to a directory goes as a link; a dangling one fails the
    // existence test, which follows links, and stays in silence.
    Put(dir / "real/kept", "keep");
    symlink((dir / "real").c_str(), (dir / "to-dir").c_str());
    symlink((dir / "gone").c_str(), (dir / "dangling").c_str());
    EXPECT_EQ(0, rvUnlink((dir / "to-dir").c_str(), 1));
    EXPECT_EQ(0, rvUnlink((dir / "dangling").c_str(), 1));
    EXPECT_FALSE(Exists(dir / "to-dir"));
    EXPECT_TRUE(Exists(dir / "real/kept") && Exists(dir / "dangling"));
    EXPECT_EQ(CouldNotRemove(dir / "t", EISDIR), capture.Text());
}

TEST(Unlink, FailedMembersAreReportedAndSkipped)
{
    TempDir dir;
    Put(dir / "t/stuck", "1");
    Put(dir / "t/free", "2");
    ScopedSysCalls restore(Sys());
    static const auto realUnlink = Sys().unlinkat;
    Sys().unlinkat = [](int directory, const char* name, int flags) {
        if (std::strcmp(name, "stuck") == 0) {
            errno = EACCES;
            return -1;
        }
        return realUnlink(directory, name, flags);
    };
    CaptureStderr capture;
    EXPECT_EQ(1, rvUnlink((dir / "t").c_str(), 1));
    EXPECT_EQ(CouldNotRemove(dir / "t/stuck", EACCES), capture.Text());
    EXPECT_TRUE(Exists(dir / "t/stuck"));
    EXPECT_FALSE(Exists(dir / "t/free"));
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
    EXPECT_EQ(0, CompareDirectoriesByFileSize(b.c_str(), a.c_str())) << "one-way";
    EXPECT_EQ(1, CompareDirectoriesByFileSize((dir.path() + "\\a").c_str(), (dir.path() + "\\b\\").c_str()))
        << "backslashes separate as slashes do";
    EXPECT_EQ(1, CompareDirectoriesByFileSize((dir / "none").c_str(), b.c_str()));
    EXPECT_EQ(0, CompareDirectoriesByFileSize(a.c_str(), (dir / "none").c_str()));
    Put(dir / "b/sub/two", "longer");
    EXPECT_EQ(0, CompareDirectoriesByFileSize(a.c_str(), b.c_str())) << "a deeper size differs";
    Put(dir / "b/sub/two", "de");
    std::filesystem::create_directory(dir / "a/kind");
    Put(dir / "b/kind", "");
    EXPECT_EQ(0, CompareDirectoriesByFileSize(a.c_str(), b.c_str())) << "directory against file";

    EXPECT_EQ(2, rvGetFileSize((dir.path() + "\\b\\sub\\two").c_str())) << "backslashes";
    EXPECT_EQ(0, rvGetFileSize((dir / "none").c_str()));
    const int fd = open((dir / "a/one").c_str(), O_RDONLY | O_CLOEXEC);
    EXPECT_EQ(3, rvGetFileSize64(reinterpret_cast<void*>(static_cast<intptr_t>(fd))));
    close(fd);
    EXPECT_EQ(-1, rvGetFileSize64(reinterpret_cast<void*>(static_cast<intptr_t>(-1))));
}

TEST(Unlink, MembersAreNamedAsTheFileNameJoinNamesThem)
{
    // The walk forms member names without asking the file system; whether
    // the joined text is a directory must not change the name.
    TempDir dir;
    Put(dir / "sub/file", "");
    for (const std::string& directory : {dir.path(), dir / "", std::string("rel/dir")}) {
        for (const char* entry :
             {"plain.txt", "sub", "...", "x.", "a.b.c", ".hidden", "back\\slash.e", "no_ext", "http:"}) {
            SCOPED_TRACE(directory + " + " + entry);
            rvFilename item(entry, 0);
            item.Directory(directory.c_str());
            EXPECT_EQ(std::string(item), tessaline::files::MemberText(directory.c_str(), entry));
        }
    }
}
