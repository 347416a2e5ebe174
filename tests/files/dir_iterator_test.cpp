

#include "files/file_fixtures.h"
#include "files/sys.h"
#include "support/scoped_sys_calls.h"
#include "tessaline/files/rvDirIterator.h"

using namespace tessaline::test;
using tessaline::files::Sys;

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

}  // namespace

TEST(rvDirIterator, PatternsMatchByFnmatch)
{
    TempDir dir;
    for (const char* name : {"a.log", ".log", ".hidden", "a.c", "b.c", "bb.c", "new\nline.txt", "sub/x"}) {
        Put(dir / name, "x");
    }
    const Names all = {".", "..", "a.log", ".log", ".hidden", "a.c", "b.c", "bb.c", "new\nline.txt", "sub"};
    const struct {
        std::string path;
        Names expected;
    } cases[] = {
        {dir.path(), all},
        {dir.path() + "/", all},
        {dir / "?.c", {"a.c", "b.c"}},
        {dir / "[!a]*.c", {"b.c", "bb.c"}},
        {dir / ".*", {".", "..", ".hidden", ".log"}},
        {"/no/such/dir/*", {}},
        {dir / "a.c/*", {}},
    };
    for (const auto& c : cases) {
        EXPECT_EQ(c.expected, Walk(c.path)) << c.path;
    }
    EXPECT_TRUE(rvDirIterator(nullptr) == rvDirIterator());
    ScopedCwd cwd(dir.path());
    EXPECT_EQ(Names({"a.log", ".log"}), Walk("./*.log"));
    EXPECT_EQ(Names(), Walk("*.log")) << "no directory part opens nothing";

    // A failing read or open ends the walk, with the error in errno.
    tessaline::testing::ScopedSysCalls restore(Sys());
    Sys().readdir = [](DIR*) -> dirent* {
        errno = EIO;
        return nullptr;
    };
    errno = 0;
    EXPECT_TRUE(rvDirIterator(".") == rvDirIterator());
    EXPECT_EQ(EIO, errno);
    Sys().opendir = [](const char*) -> DIR* { return nullptr; };
    EXPECT_TRUE(rvDirIterator(".") == rvDirIterator());
}

TEST(rvDirIterator, CopiesShareOneWalk)
{
    TempDir dir;
    Put(dir / "a", "");
    Put(dir / "b", "");
    const long baseline = OpenDescriptors();
    rvDirIterator first(dir.path().c_str());
    rvDirIterator copy(first);
    EXPECT_TRUE(copy == first);
    EXPECT_FALSE(copy == rvDirIterator(dir.path().c_str())) << "separate walks never equal";
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
    for (; assigned != rvDirIterator(); ++assigned) {
        seen.insert(*assigned);
    }
    EXPECT_EQ(4u, seen.size()) << "every entry once, . and .. included";
    EXPECT_TRUE(copy == first) << "other copies still hold the walk";
    ++copy;
    EXPECT_TRUE(copy == rvDirIterator()) << "and end on their own increment";
    old = first = rvDirIterator();
    EXPECT_EQ(baseline, OpenDescriptors()) << "the last reference closes the directory";
}
