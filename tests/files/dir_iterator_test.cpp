#include <cerrno>
#include <filesystem>
#include <set>
#include <string>

#include <gtest/gtest.h>

#include "files/sys.h"
#include "files/temp_tree.h"
#include "tessaline/files/rvDirIterator.h"

using tessaline::files::ScopedSysCalls;
using tessaline::files::Sys;
using tessaline::test::ScopedCwd;
using tessaline::test::TempTree;

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

int OpenDescriptors()
{
    int count = 0;
    for (const auto& entry : std::filesystem::directory_iterator("/proc/self/fd")) {
        (void)entry;
        ++count;
    }
    return count;
}

class DirIteratorTest : public testing::Test {
protected:
    void SetUp() override
    {
        for (const char* name : {"a.log", "b.txt", ".hidden", ".log", "a.c", "b.c", "bb.c",
                                 "report.txt", "with space.txt", "new\nline.txt"}) {
            m_tree.Write(name, "x");
        }
        m_tree.MakeDir("sub");
    }

    std::string Path(const std::string& relative) const { return m_tree.Path(relative); }

    TempTree m_tree;
};

}  // namespace

TEST_F(DirIteratorTest, DirectoryAloneWalksEverythingOnce)
{
    const Names all = {".", "..", "a.log", "b.txt", ".hidden", ".log", "a.c", "b.c", "bb.c",
                       "report.txt", "with space.txt", "new\nline.txt", "sub"};
    EXPECT_EQ(all, Walk(m_tree.Root()));
    EXPECT_EQ(all, Walk(m_tree.Root() + "/"));
    EXPECT_EQ(all, Walk(m_tree.Root() + "/*"));
    {
        ScopedCwd cwd(m_tree.Root());
        EXPECT_EQ(all, Walk("."));
        EXPECT_EQ(Names({"a.log", ".log"}), Walk("./*.log"));
    }
}

TEST_F(DirIteratorTest, PatternsMatchByFnmatch)
{
    const struct {
        const char* pattern;
        Names expected;
    } cases[] = {
        {"*.log", {"a.log", ".log"}},
        {"?.c", {"a.c", "b.c"}},
        {"[ab].c", {"a.c", "b.c"}},
        {"[!a]*.c", {"b.c", "bb.c"}},
        {".*", {".", "..", ".hidden", ".log"}},
        {"report.txt", {"report.txt"}},
        {"with space.*", {"with space.txt"}},
        {"new\nline.txt", {"new\nline.txt"}},
        {"*.LOG", {}},
        {"missing.txt", {}},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.pattern);
        EXPECT_EQ(c.expected, Walk(Path(c.pattern)));
    }
}

TEST_F(DirIteratorTest, NothingToOpenIsTheEnd)
{
    const rvDirIterator end;
    EXPECT_TRUE(rvDirIterator("/no/such/dir/*") == end);
    EXPECT_TRUE(rvDirIterator(nullptr) == end);
    EXPECT_TRUE(rvDirIterator(Path("b.txt/*").c_str()) == end) << "a path through a file";
    ScopedCwd cwd(m_tree.Root());
    EXPECT_TRUE(rvDirIterator("*.log") == end) << "no directory part opens nothing";
    {
        ScopedSysCalls restore;
        Sys().opendir = [](const char*) -> DIR* {
            errno = EACCES;
            return nullptr;
        };
        EXPECT_TRUE(rvDirIterator(".") == end);
    }
}

TEST_F(DirIteratorTest, ReadErrorEndsTheWalkWithItsCode)
{
    ScopedSysCalls restore;
    static int reads;
    reads = 0;
    static const auto realReaddir = Sys().readdir;
    Sys().readdir = [](DIR* dir) -> dirent* {
        if (++reads > 1) {
            errno = EIO;
            return nullptr;
        }
        return realReaddir(dir);
    };
    rvDirIterator it(m_tree.Root().c_str());
    ASSERT_FALSE(it == rvDirIterator());
    errno = 0;
    ++it;
    EXPECT_TRUE(it == rvDirIterator());
    EXPECT_EQ(EIO, errno);
}

TEST_F(DirIteratorTest, CopiesShareOnePosition)
{
    rvDirIterator first(m_tree.Root().c_str());
    rvDirIterator copy(first);
    EXPECT_TRUE(copy == first);
    EXPECT_FALSE(copy == rvDirIterator(m_tree.Root().c_str())) << "separate walks never equal";
    EXPECT_FALSE(copy == rvDirIterator());

    const std::string before = *first;
    ++copy;
    EXPECT_NE(before, *copy);
    EXPECT_EQ(std::string(*copy), *first) << "the shared buffer holds the new name";

    rvDirIterator old = first++;
    EXPECT_TRUE(old == first) << "a post-increment copy shares the walk";

    rvDirIterator assigned;
    assigned = first;
    rvDirIterator& alias = assigned;
    assigned = alias;
    EXPECT_TRUE(assigned == first);
    assigned = rvDirIterator();
    EXPECT_TRUE(assigned == rvDirIterator());
    EXPECT_TRUE(rvDirIterator() == rvDirIterator());

    std::set<std::string> seen = {before};
    int delivered = 1;
    for (; first != rvDirIterator(); ++first, ++delivered) {
        seen.insert(*first);
    }
    EXPECT_EQ(12, delivered) << "the entry skipped by ++copy is not delivered again";
    EXPECT_EQ(12u, seen.size());
    EXPECT_FALSE(copy == rvDirIterator()) << "other copies end on their own increment";
    ++copy;
    EXPECT_TRUE(copy == rvDirIterator());
    ++copy;
    EXPECT_TRUE(copy == rvDirIterator()) << "advancing the end does nothing";
}

TEST_F(DirIteratorTest, DirectoryClosesWithTheLastReference)
{
    const int baseline = OpenDescriptors();
    {
        rvDirIterator first(m_tree.Root().c_str());
        EXPECT_EQ(baseline + 1, OpenDescriptors());
        {
            rvDirIterator copy(first);
            rvDirIterator another;
            another = first;
            EXPECT_EQ(baseline + 1, OpenDescriptors());
        }
        EXPECT_EQ(baseline + 1, OpenDescriptors()) << "left in the middle, still held";
    }
    EXPECT_EQ(baseline, OpenDescriptors());

    rvDirIterator walk(m_tree.Root().c_str());
    while (walk != rvDirIterator()) {
        ++walk;
    }
    EXPECT_EQ(baseline, OpenDescriptors()) << "reaching the end lets go at once";
}
