#include <cerrno>
#include <filesystem>
#include <set>
#include <string>

#include <gtest/gtest.h>

#include "files/file_fixtures.h"
#include "files/sys.h"
#include "support/scoped_sys_calls.h"
#include "util/sys.h"
#include "support/temp_dir.h"
#include "tessaline/files/rvDirIterator.h"

using namespace tessaline::test;
using tessaline::files::Sys;
using tessaline::testing::ScopedSysCalls;

namespace {

using Names = std::multiset<std::string>;

Names Walk(const std::string& path)
{
    Names names;
    for (rvDirIterator it(path.c_str()); it != rvDirIterator(); ++it) {
        names.insert(*it);
    }
    return names;
}

long OpenDescriptors()
{
    const std::filesystem::directory_iterator fds("/proc/self/fd");
    return std::distance(begin(fds), end(fds));
}

class DirIteratorTest : public testing::Test {
protected:
    void SetUp() override
    {
        for (const char* name : {"a.log", ".log", ".hidden", "a.c", "b.c", "bb.c", "with space.txt", "new\nline.txt"}) {
            Put(m_dir / name, "x");
        }
        std::filesystem::create_directory(m_dir / "sub");
    }

    TempDir m_dir;
};

}  // namespace

TEST_F(DirIteratorTest, PatternsMatchByFnmatch)
{
    const Names all = {".",   "..",   "a.log",          ".log",          ".hidden", "a.c",
                       "b.c", "bb.c", "with space.txt", "new\nline.txt", "sub"};
    const struct {
        std::string path;
        Names expected;
    } cases[] = {
        {m_dir.path(), all},
        {m_dir.path() + "/", all},
        {m_dir / "*.log", {"a.log", ".log"}},
        {m_dir / "?.c", {"a.c", "b.c"}},
        {m_dir / "[!a]*.c", {"b.c", "bb.c"}},
        {m_dir / ".*", {".", "..", ".hidden", ".log"}},
        {m_dir / "new\nline.txt", {"new\nline.txt"}},
        {m_dir / "with space.*", {"with space.txt"}},
        {m_dir / "*.LOG", {}},
        {"/no/such/dir/*", {}},
        {m_dir / "a.c/*", {}},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.path);
        EXPECT_EQ(c.expected, Walk(c.path));
    }
    EXPECT_TRUE(rvDirIterator(nullptr) == rvDirIterator());

    ScopedCwd cwd(m_dir.path());
    EXPECT_EQ(all, Walk("."));
    EXPECT_EQ(Names({"a.log", ".log"}), Walk("./*.log"));
    EXPECT_EQ(Names(), Walk("*.log")) << "no directory part opens nothing";
}

TEST_F(DirIteratorTest, FailuresEndTheWalk)
{
    ScopedSysCalls restore(Sys());
    static const auto realReaddir = Sys().readdir;
    Sys().readdir = [](DIR* dir) -> dirent* {
        static int reads = 0;
        if (++reads % 2 == 0) {
            errno = EIO;
            return nullptr;
        }
        return realReaddir(dir);
    };
    rvDirIterator it(m_dir.path().c_str());
    ASSERT_FALSE(it == rvDirIterator());
    ++it;
    EXPECT_TRUE(it == rvDirIterator());
    EXPECT_EQ(EIO, errno);

    Sys().opendir = [](const char*) -> DIR* {
        errno = EACCES;
        return nullptr;
    };
    EXPECT_TRUE(rvDirIterator(m_dir.path().c_str()) == rvDirIterator());
}

TEST_F(DirIteratorTest, CopiesShareOneWalk)
{
    const long baseline = OpenDescriptors();
    rvDirIterator first(m_dir.path().c_str());
    rvDirIterator copy(first);
    EXPECT_TRUE(copy == first);
    EXPECT_FALSE(copy == rvDirIterator(m_dir.path().c_str())) << "separate walks never equal";
    EXPECT_FALSE(copy == rvDirIterator());
    EXPECT_EQ(baseline + 1, OpenDescriptors()) << "one directory for all copies";

    std::set<std::string> seen = {*first};
    ++copy;
    EXPECT_EQ(std::string(*copy), *first) << "the other copy reads the new entry";
    seen.insert(*copy);
    rvDirIterator old = first++;
    EXPECT_TRUE(old == first);

    rvDirIterator assigned;
    assigned = first;
    rvDirIterator& alias = assigned;
    assigned = alias;
    EXPECT_TRUE(assigned == first);

    for (; first != rvDirIterator(); ++first) {
        seen.insert(*first);
    }
    EXPECT_EQ(11u, seen.size()) << "every entry once, . and .. included";
    EXPECT_EQ(baseline + 1, OpenDescriptors()) << "other copies still hold the walk";
    ++copy;
    EXPECT_TRUE(copy == rvDirIterator()) << "and end on their own increment";
    ++copy;
    old = assigned = rvDirIterator();
    EXPECT_EQ(baseline, OpenDescriptors()) << "the last reference closes the directory";
}
