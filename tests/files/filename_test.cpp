// Taking names apart and putting them together with rvFilename, and asking
// the file system about them.

#include "files/file_fixtures.h"
#include "tessaline/files/rvFilename.h"

namespace {

using tessaline::test::TempDir;

constexpr const char* kWhole = "<whole>";
constexpr const char* kNull = nullptr;

// A field as text, null shown as such; "@" in an expectation stands for an
// existing directory.
std::string Show(const char* text, const std::string& dir = "")
{
    if (!text)
        return "(null)";
    std::string shown = text;
    if (size_t at = shown.find('@'); at != std::string::npos)
        shown.replace(at, 1, dir);
    return shown;
}

struct SplitRow {
    const char *text, *scheme, *server, *directory, *file, *ext, *pathname, *filename, *url;
};

// Only "@" exists as a directory.
const SplitRow kSplitRows[] = {
    {"/usr/local/lib/report.tar.gz", kNull, kNull, "/usr/local/lib", "report.tar", "gz", kWhole, "report.tar.gz", ""},
    {"report.txt", kNull, kNull, kNull, "report", "txt", kWhole, kWhole, ""},
    {"report", kNull, kNull, kNull, "report", kNull, kWhole, kWhole, ""},
    {".profile", kNull, kNull, kNull, kNull, "profile", kWhole, kWhole, ""},
    {"a.", kNull, kNull, kNull, "a", "", kWhole, kWhole, ""},
    {".", kNull, kNull, ".", kNull, kNull, "", kWhole, ""},
    {"..", kNull, kNull, "..", kNull, kNull, "", kWhole, ""},
    {"/", kNull, kNull, "/", kNull, kNull, kWhole, kWhole, ""},
    {"@", kNull, kNull, "@", kNull, kNull, "", kWhole, ""},
    {"@/", kNull, kNull, "@", kNull, kNull, kWhole, kWhole, ""},
    {"@/*.log", kNull, kNull, "@", "*", "log", kWhole, "*.log", ""},
    {"dir/", kNull, kNull, "dir", kNull, kNull, kWhole, kWhole, ""},
    {"/a.b/c", kNull, kNull, "/a.b", "c", kNull, kWhole, "c", ""},
    {"/a//b.txt", kNull, kNull, "/a", "b", "txt", "", "b.txt", ""},
    {"/ab/b", kNull, kNull, "/ab", "b", kNull, kWhole, "b/b", ""},
    {"c:/temp/x.txt", kNull, kNull, "c:/temp", "x", "txt", kWhole, "x.txt", ""},
    {"//host/share/f.txt", kNull, "host", "/share", "f", "txt", "/share/f.txt", "f.txt", ""},
    {"//host", kNull, "host", "", kNull, kNull, kWhole, kWhole, ""},
    {"http://host/dir/page.html", "http", "host", "/dir", "page", "html", "/dir/page.html", "page.html", kWhole},
    {"http://host", "http", "host", "", kNull, kNull, kWhole, kWhole, kWhole},
    {"http://host/dir/", "http", "host", "/dir", kNull, kNull, "/dir/", kWhole, kWhole},
    {"file://etc/hosts", "file", kNull, "etc", "hosts", kNull, "etc/hosts", "hosts", kWhole},
    {"file:///etc/hosts", "file", kNull, "etc", "hosts", kNull, "etc/hosts", "hosts", ""},
    {"file:////etc/hosts", "file", kNull, "/etc", "hosts", kNull, "/etc/hosts", "hosts", ""},
    {"http:///dir/f.txt", "http", "dir", "/", "f", "txt", "/f.txt", "f.txt", ""},
    {"http://host///d/f", "http", kNull, "/host///d", "f", kNull, "/host///d/f", "f", ""},
    // Backslashes cut nothing; only the stored text is turned.
    {"C:\\temp\\x.txt", kNull, kNull, kNull, "C:\\temp\\x", "txt", "C:/temp/x.txt", "C:/temp/x.txt", ""},
};

TEST(rvFilenameSplit, WorkedNames)
{
    TempDir existing;
    const std::string& dir = existing.path();
    for (const SplitRow& row : kSplitRows) {
        std::string text = Show(row.text, dir);
        SCOPED_TRACE(text);
        rvFilename name(text.c_str(), 0);
        auto part = [&](const char* expected) { return expected == kWhole ? Show(name()) : Show(expected, dir); };
        EXPECT_EQ(Show(name.m_pScheme), Show(row.scheme));
        EXPECT_EQ(Show(name.m_pServer), Show(row.server));
        EXPECT_EQ(Show(name.m_pDirectory), Show(row.directory, dir));
        EXPECT_EQ(Show(name.m_pFile), Show(row.file));
        EXPECT_EQ(Show(name.m_pExt), Show(row.ext));
        EXPECT_EQ(Show(name.Pathname()), part(row.pathname));
        EXPECT_EQ(Show(name.Filename()), part(row.filename));
        EXPECT_EQ(Show(name.URL()), part(row.url));
        EXPECT_STREQ(name.LocalPath(), name.Pathname());
    }
}

TEST(rvFilenameSplit, MoreNames)
{
    TempDir existing;
    const char* dir = existing.path().c_str();
    {
        // Remote names are never taken whole as directories.
        rvFilename remote("/tmp", 1);
        EXPECT_STREQ(remote.Directory(), "/");
        EXPECT_STREQ(remote.File(), "tmp");
        EXPECT_EQ(rvFilename("https://h/a", 0).m_remote, 1u);
        EXPECT_EQ(rvFilename("FTPS://h/a", 0).m_remote, 1u);
        EXPECT_EQ(rvFilename("file://h/a", 0).m_remote, 0u);
        rvFilename once("http://host/a", 0);
        once = dir;
        EXPECT_STRNE(once.Directory(), dir) << "an object stays remote";
        EXPECT_STREQ(rvFilename(once).Directory(), dir) << "a copy does not";
    }
    {
        // The same text, in any case, keeps the stored one.
        rvFilename name("a/b", 0);
        const char* before = name();
        name = "A/B";
        EXPECT_EQ(name(), before);
        name = "d";
        EXPECT_EQ(name.m_pDirectory, nullptr);
    }
    {
        // A re-split that finds a directory keeps the file and extension.
        ASSERT_EQ(mkdir((existing / "entry.d").c_str(), 0700), 0);
        rvFilename name("entry.d", 0);
        EXPECT_EQ(name.Directory(dir), existing / "entry.d");
        EXPECT_EQ(name.Directory(), existing / "entry.d");
        EXPECT_STREQ(name.File(), "entry");
        EXPECT_STREQ(name.Ext(), "d");
    }
    {
        // Text past the 4094th character takes no part in the split but stays.
        rvFilename name(("/\\" + std::string(9996, 'a') + "\\z").c_str(), 0);
        EXPECT_STREQ(name.Directory(), "/");
        EXPECT_EQ(strlen(name.File()), 4093u);
        EXPECT_EQ(strlen(name()), 10000u);
        EXPECT_EQ(name()[9998], '\\');
    }
}

TEST(rvFilenameJoin, SeparatorsAndSetters)
{
    rvFilename joined;
    EXPECT_STREQ(joined.Join(nullptr, nullptr, nullptr, nullptr, nullptr), "");
    EXPECT_EQ(joined.m_pPath, nullptr);
    EXPECT_STREQ(joined.Join("http", "host", "dir", "f", "txt"), "http://hostdir/f.txt");
    EXPECT_STREQ(joined.Join("http://", "host", "/d", nullptr, nullptr), "http://host/d/");
    EXPECT_STREQ(joined.Directory(), "/d");
    EXPECT_STREQ(joined.Join(nullptr, "host", "/share\\", "f", "txt"), "//host/share/f.txt");

    rvFilename name("/a/b.txt", 0);
    EXPECT_STREQ(name.Ext("data"), "/a/b.data");
    EXPECT_STREQ(name.Ext(nullptr), "/a/b");
    name = "/a/b.txt";
    EXPECT_STREQ(name.File("c.d"), "/a/c.d.txt");
    EXPECT_STREQ(name.File(), "c.d");
    EXPECT_STREQ(name.Server("host"), "//host/a/c.d.txt");
    EXPECT_EQ(name.IsURL(), 0);
    EXPECT_STREQ(name.Scheme("ftp"), "ftp://host/a/c.d.txt");
    EXPECT_EQ(name.IsURL(), 1);

    // Removing the only component leaves nothing to join.
    rvFilename bare("report", 0);
    EXPECT_STREQ(bare.File(nullptr), "");
    EXPECT_STREQ(bare(), "report");
}

TEST(rvFilename, DupAndComparison)
{
    rvFilename name;
    char* copy = name.Dup("abcdefgh", 2);  // a capacity of 4 bytes, not a cut
    EXPECT_STREQ(copy, "abc");
    delete[] copy;
    copy = name.Dup("ab", 10);
    EXPECT_EQ(std::string(copy, 12), std::string("ab\0\0\0\0\0\0\0\0\0\0", 12));
    delete[] copy;
    EXPECT_EQ(name.Dup(nullptr, 5), nullptr);

    // Equal ignoring case; "less" sorts descending, and two empty objects
    // are both equal and less.
    rvFilename none, otherNone, a("/x/a", 0), upperA("/X/A", 0), b("/x/b", 0);
    EXPECT_TRUE(a == upperA && none == otherNone);
    EXPECT_FALSE(a == b || none == a);
    EXPECT_TRUE(b < a && none < otherNone);
    EXPECT_FALSE(a < b || a < upperA || none < a || a < none);
}

TEST(rvFilenameQuery, IsDirectoryAndTranslators)
{
    TempDir dir;
    close(open((dir / "file").c_str(), O_CREAT | O_WRONLY | O_CLOEXEC, 0600));
    ASSERT_EQ(symlink(dir.path().c_str(), (dir / "link").c_str()), 0);
    for (const std::string& yes : {dir.path() + "//", dir.path() + "\\", dir / "link", std::string(10000, '/')})
        EXPECT_EQ(rvFilename::IsDirectory(yes.c_str()), 1) << yes.substr(0, 80);
    for (const std::string& no : {dir / "file", dir / "file/", dir / "missing" + std::string(4000, '/'), std::string()})
        EXPECT_EQ(rvFilename::IsDirectory(no.c_str()), 0) << no.substr(0, 80);
    EXPECT_EQ(rvFilename::IsDirectory(nullptr), 0);
    EXPECT_EQ(rvFilename((dir / "file").c_str(), 0).Exists(F_OK), 1);
    EXPECT_EQ(rvFilename::Exists((dir / "missing").c_str(), F_OK), 0);

    // The text form keeps a URL's "://"; the rope form has no URL rule.
    std::string text = "http://host/a/b";
    EXPECT_STREQ(rvFilename::XlatPathToDOS(text.data()), "http://host\\a\\b");
    EXPECT_EQ(rvFilename::XlatPathToDOS(nullptr), nullptr);
    rvFilename::rope url("http://host/a");
    EXPECT_EQ(rvFilename::XlatPathToDOS(url), rvFilename::rope("http:\\\\host\\a"));
    EXPECT_EQ(rvFilename::NormalizePath(url), rvFilename::rope("http://host/a"));
}

}  // namespace
