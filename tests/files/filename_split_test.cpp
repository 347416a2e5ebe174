// Taking names apart and putting them together with rvFilename.
#include <stdlib.h>
#include <unistd.h>

#include <string>

#include <gtest/gtest.h>

#include "support/temp_dir.h"
#include "tessaline/files/rvFilename.h"

namespace {

using tessaline::test::TempDir;

constexpr const char* kWhole = "<whole text>";
constexpr const char* kNull = nullptr;

// What a component field holds, with "@" in an expected text standing for an
// existing directory.
std::string Show(const char* text, const std::string& directory = "")
{
    if (!text)
        return "(null)";
    std::string shown = text;
    size_t at = shown.find('@');
    if (at != std::string::npos)
        shown.replace(at, 1, directory);
    return "\"" + shown + "\"";
}

std::string ExpectedPart(const char* expected, const rvFilename& name, const std::string& directory)
{
    return expected == kWhole ? Show(name()) : Show(expected, directory);
}

struct SplitRow {
    const char* text;
    const char* scheme;
    const char* server;
    const char* directory;
    const char* file;
    const char* ext;
    const char* pathname;
    const char* filename;
    const char* url;
};

// Every name on a fresh local object. Only "@" exists as a directory.
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
};

TEST(rvFilenameSplit, WorkedNames)
{
    TempDir existing;
    const std::string& dir = existing.path();
    for (const SplitRow& row : kSplitRows) {
        std::string text = Show(row.text, dir);
        text = text.substr(1, text.size() - 2);
        SCOPED_TRACE(text);
        rvFilename name(text.c_str(), 0);
        EXPECT_EQ(Show(name.m_pScheme), Show(row.scheme));
        EXPECT_EQ(Show(name.m_pServer), Show(row.server));
        EXPECT_EQ(Show(name.m_pDirectory), Show(row.directory, dir));
        EXPECT_EQ(Show(name.m_pFile), Show(row.file));
        EXPECT_EQ(Show(name.m_pExt), Show(row.ext));
        EXPECT_EQ(Show(name.Pathname()), ExpectedPart(row.pathname, name, dir));
        EXPECT_EQ(Show(name.Filename()), ExpectedPart(row.filename, name, dir));
        EXPECT_EQ(Show(name.URL()), ExpectedPart(row.url, name, dir));
        EXPECT_STREQ(name.LocalPath(), name.Pathname());
        EXPECT_EQ(name.m_pFullDirectory, nullptr);
    }
}

TEST(rvFilenameSplit, NamesOutsideTheGrammar)
{
    {
        // Backslashes do not cut directories; only the stored text is turned.
        rvFilename name("C:\\temp\\x.txt", 0);
        EXPECT_EQ(name.m_pDirectory, nullptr);
        EXPECT_STREQ(name.File(), "C:\\temp\\x");
        EXPECT_STREQ(name.Ext(), "txt");
        EXPECT_STREQ(name(), "C:/temp/x.txt");
    }
    {
        rvFilename name("mailto:x", 0);
        EXPECT_EQ(name.m_pScheme, nullptr);
        EXPECT_STREQ(name.File(), "mailto:x");
    }
    {
        rvFilename name("https://host/a", 0);
        EXPECT_EQ(name.m_remote, 1u);
        rvFilename ftps("FTPS://host/a", 0);
        EXPECT_EQ(ftps.m_remote, 1u);
        rvFilename local("file://host/a", 0);
        EXPECT_EQ(local.m_remote, 0u);
    }
}

TEST(rvFilenameSplit, RemoteNamesDoNotAskTheFileSystem)
{
    TempDir existing;
    rvFilename name(existing.path().c_str(), 1);
    std::string parent = existing.path().substr(0, existing.path().rfind('/'));
    EXPECT_STREQ(name.Directory(), parent.empty() ? "/" : parent.c_str());
    EXPECT_STREQ(name.File(), existing.path().substr(parent.size() + 1).c_str());

    rvFilename root("/tmp", 1);
    EXPECT_STREQ(root.Directory(), "/");
    EXPECT_STREQ(root.File(), "tmp");
}

TEST(rvFilenameSplit, ObjectsOnceRemoteStayRemote)
{
    TempDir existing;
    rvFilename name("http://host/a", 0);
    name = existing.path().c_str();
    EXPECT_EQ(name.m_remote, 1u);
    EXPECT_STRNE(name.Directory(), existing.path().c_str());

    rvFilename copy(name);
    EXPECT_EQ(copy.m_remote, 0u);
    EXPECT_STREQ(copy.Directory(), existing.path().c_str());
}

TEST(rvFilenameSplit, AssignmentIgnoresLetterCase)
{
    rvFilename name("a/b", 0);
    const char* before = name();
    name = "A/B";
    EXPECT_EQ(name(), before);
    EXPECT_STREQ(name(), "a/b");

    name = "a/c.txt";
    EXPECT_STREQ(name.Directory(), "a");
    EXPECT_STREQ(name.File(), "c");
    EXPECT_STREQ(name.Ext(), "txt");

    // Assignment starts from a clean slate.
    name = "d";
    EXPECT_EQ(name.m_pDirectory, nullptr);
    EXPECT_EQ(name.m_pExt, nullptr);
    EXPECT_STREQ(name.File(), "d");
}

TEST(rvFilenameSplit, SplitKeepsComponentsItDoesNotFind)
{
    TempDir existing;
    ASSERT_EQ(mkdir((existing.path() + "/entry.d").c_str(), 0700), 0);

    rvFilename name("entry.d", 0);
    EXPECT_STREQ(name.Directory(existing.path().c_str()), (existing.path() + "/entry.d").c_str());
    // The joined name is an existing directory, taken whole; file and
    // extension stay from before.
    EXPECT_STREQ(name.Directory(), (existing.path() + "/entry.d").c_str());
    EXPECT_STREQ(name.File(), "entry");
    EXPECT_STREQ(name.Ext(), "d");
}

TEST(rvFilenameJoin, Separators)
{
    {
        rvFilename name;
        EXPECT_STREQ(name.Join("http", "host", "dir", "f", "txt"), "http://hostdir/f.txt");
    }
    {
        rvFilename name;
        EXPECT_STREQ(name.Join("http://", "host", "/d", nullptr, nullptr), "http://host/d/");
        EXPECT_STREQ(name.Directory(), "/d");
        EXPECT_STREQ(name.Server(), "host");
    }
    {
        rvFilename name;
        EXPECT_STREQ(name.Join(nullptr, "host", "/share\\", "f", "txt"), "//host/share/f.txt");
    }
    {
        rvFilename name;
        EXPECT_STREQ(name.Join(nullptr, nullptr, nullptr, nullptr, nullptr), "");
        EXPECT_EQ(name.m_pPath, nullptr);
        EXPECT_STREQ(name.Join("", "", "", "", ""), "");
        EXPECT_STREQ(name(), "");
    }
}

TEST(rvFilenameJoin, SettersRewriteTheText)
{
    rvFilename name("/a/b.txt", 0);
    EXPECT_STREQ(name.Ext("dat"), "/a/b.dat");
    EXPECT_STREQ(name.Ext(nullptr), "/a/b");
    EXPECT_EQ(name.m_pExt, nullptr);

    name = "/a/b.txt";
    EXPECT_STREQ(name.File("c.d"), "/a/c.d.txt");
    EXPECT_STREQ(name.File(), "c.d");
    EXPECT_STREQ(name.Ext(), "txt");

    EXPECT_STREQ(name.Server("host"), "//host/a/c.d.txt");
    EXPECT_EQ(name.IsURL(), 0);
    EXPECT_STREQ(name.Scheme("ftp"), "ftp://host/a/c.d.txt");
    EXPECT_EQ(name.IsURL(), 1);
    EXPECT_EQ(name.m_remote, 1u);
    EXPECT_STREQ(name.Directory("/x"), "ftp://host/x/c.d.txt");

    // Removing the only component leaves nothing to join.
    rvFilename bare("report", 0);
    EXPECT_STREQ(bare.File(nullptr), "");
    EXPECT_STREQ(bare(), "report");
}

TEST(rvFilenameJoin, SettersGoThroughTheVirtualJoin)
{
    struct CountingName : rvFilename {
        using rvFilename::rvFilename;
        const char* Join(const char* scheme, const char* server, const char* directory, const char* file,
                         const char* ext) override
        {
            ++joins;
            return rvFilename::Join(scheme, server, directory, file, ext);
        }
        int joins = 0;
    };
    CountingName name("/a/b.txt", 0);
    name.Ext("c");
    EXPECT_EQ(name.joins, 2);  // the setter's, then the stored components'
}

TEST(rvFilenameJoin, ArgumentsMayPointIntoTheObject)
{
    rvFilename name("/a/b.txt", 0);
    EXPECT_STREQ(name.File(name.m_pFile), "/a/b.txt");
    EXPECT_STREQ(name.Ext(name.Ext()), "/a/b.txt");
    EXPECT_STREQ(name.Directory(name.m_pDirectory), "/a/b.txt");
    EXPECT_STREQ(name.Join(nullptr, nullptr, name.Pathname(), nullptr, nullptr), "/a/b.txt/");

    name = "/a/b.txt";
    name = name.Filename();
    EXPECT_STREQ(name(), "b.txt");
    name.Split(name());
    EXPECT_STREQ(name(), "b.txt");
}

TEST(rvFilename, Dup)
{
    rvFilename name;
    char* copy = name.Dup("abcdefgh", 2);  // a capacity: 4 bytes
    EXPECT_STREQ(copy, "abc");
    delete[] copy;
    copy = name.Dup("ab", 10);
    EXPECT_EQ(std::string(copy, 12), std::string("ab\0\0\0\0\0\0\0\0\0\0", 12));
    delete[] copy;
    copy = name.Dup("abc", -1);
    EXPECT_STREQ(copy, "abc");
    delete[] copy;
    EXPECT_EQ(name.Dup(nullptr, 5), nullptr);

    char* field = name.Dup("old", -1);
    EXPECT_STREQ(name.Dup(&field, field + 1, -1), "ld");
    EXPECT_STREQ(field, "ld");
    EXPECT_EQ(name.Dup(&field, nullptr, -1), nullptr);
    EXPECT_EQ(field, nullptr);
}

TEST(rvFilename, Comparison)
{
    rvFilename none;
    rvFilename otherNone;
    rvFilename a("/x/a", 0);
    rvFilename upperA("/X/A", 0);
    rvFilename b("/x/b", 0);

    EXPECT_TRUE(a == upperA);
    EXPECT_FALSE(a == b);
    EXPECT_TRUE(none == otherNone);
    EXPECT_FALSE(none == a);
    EXPECT_FALSE(a == none);

    EXPECT_TRUE(b < a);
    EXPECT_FALSE(a < b);
    EXPECT_FALSE(a < upperA);
    EXPECT_TRUE(none < otherNone);
    EXPECT_FALSE(none < a);
    EXPECT_FALSE(a < none);
}

TEST(rvFilename, ObjectsWithoutText)
{
    rvFilename name;
    EXPECT_STREQ(name(), "");
    EXPECT_STREQ(static_cast<const char*>(name), "");
    for (const char* part : {name.URL(), name.Pathname(), name.Filename(), name.LocalPath(), name.Scheme(),
                             name.Server(), name.FullDirectory(), name.Directory(), name.File(), name.Ext()})
        EXPECT_STREQ(part, "");
    EXPECT_EQ(name.IsDirectory(), 0);
    EXPECT_EQ(name.IsURL(), 0);
    EXPECT_EQ(name.Exists(0), 0);
    EXPECT_EQ(name.Empty(nullptr), 1);
    name.Split(nullptr);
    name = static_cast<const char*>(nullptr);
    EXPECT_EQ(name.m_pPath, nullptr);

    name = "/a/b.txt";
    name = static_cast<const char*>(nullptr);
    EXPECT_EQ(name.m_pPath, nullptr);
    EXPECT_EQ(name.m_pFile, nullptr);
    EXPECT_STREQ(name.Pathname(), "");

    name = "";
    EXPECT_STREQ(name(), "");
    EXPECT_EQ(name.m_pDirectory, nullptr);
    EXPECT_STREQ(name.Filename(), "");
}

TEST(rvFilename, AwkwardTexts)
{
    {
        // Text past the 4094th character takes no part in the split but stays.
        std::string text = "/\\" + std::string(9996, 'a') + "\\z";
        rvFilename name(text.c_str(), 0);
        EXPECT_EQ(strlen(name()), 10000u);
        EXPECT_STREQ(name.Directory(), "/");
        EXPECT_EQ(strlen(name.File()), 4093u);
        EXPECT_EQ(name()[1], '/');
        EXPECT_EQ(name()[9998], '\\');
    }
    {
        rvFilename name(std::string(10000, '/').c_str(), 0);
        EXPECT_STREQ(name.Server(), "");
        EXPECT_STREQ(name.Directory(), "/");
    }
    {
        rvFilename name("://", 0);
        EXPECT_STREQ(name.m_pScheme, "");
        EXPECT_STREQ(name.m_pServer, "");
        EXPECT_STREQ(name.m_pDirectory, "");
        EXPECT_STREQ(name.URL(), "://");
    }
    {
        rvFilename name(std::string(10000, '\\').c_str(), 0);
        EXPECT_EQ(name.m_pDirectory, nullptr);
        EXPECT_EQ(strlen(name.File()), 4094u);
        EXPECT_EQ(std::string(name()).find('\\'), 4095u);
    }
    {
        std::string text = "http://" + std::string(5000, 'h') + "/d/f.x";
        rvFilename name(text.c_str(), 0);
        EXPECT_EQ(strlen(name.Server()), 4087u);
        EXPECT_STREQ(name.m_pDirectory, "");
        EXPECT_STREQ(name.URL(), name());
    }
}

}  // namespace
