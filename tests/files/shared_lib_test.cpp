// Loading shared objects through rvSharedLib.
#include <dlfcn.h>

#include "files/file_fixtures.h"
#include "files/sys.h"
#include "support/scoped_sys_calls.h"
#include "tessaline/files/rvSharedLib.h"

namespace {

using tessaline::files::Sys;

const std::string kPlugin = TESSALINE_TEST_PLUGIN_DIR "/libtessaline_plugin";

int CallAnswer(rvSharedLib& lib)
{
    auto answer = reinterpret_cast<int (*)()>(lib.ProcAddr("tessaline_plugin_answer"));
    return answer ? answer() : -1;
}

TEST(rvSharedLib, ExtensionsAndDisposition)
{
    rvSharedLib lib(kPlugin.c_str(), 7);
    ASSERT_EQ(lib.IsValid(), 1);
    EXPECT_STREQ(lib, kPlugin.c_str());
    EXPECT_EQ(lib.Disposition(), RTLD_NOW | RTLD_GLOBAL);
    EXPECT_EQ(CallAnswer(lib), 42);

    // A name with an extension of its own goes unchanged; the default one
    // is class-wide, cut to 15 characters.
    tessaline::test::TempDir dir;
    std::filesystem::copy_file(kPlugin + ".so", dir / "libx.so.2");
    std::filesystem::copy_file(kPlugin + ".so", dir / "libx.dll");
    EXPECT_EQ(rvSharedLib((dir / "libx.so.2").c_str(), 0).IsValid(), 1);
    rvSharedLib other((dir / "libx").c_str(), 0);
    EXPECT_EQ(other.IsValid(), 0);
    EXPECT_STREQ(rvSharedLib::DefaultExtension("dll"), "dll");
    EXPECT_EQ(other.Open((dir / "libx").c_str(), RTLD_LAZY, 0), 1);
    EXPECT_STREQ(other, (dir / "libx.dll").c_str());
    EXPECT_STREQ(rvSharedLib::DefaultExtension("abcdefghijklmnopqrst"), "abcdefghijklmno");
    EXPECT_STREQ(rvSharedLib::DefaultExtension("so"), "so");

    // A failed open keeps the disposition of the last good one.
    EXPECT_EQ(other.Disposition(), RTLD_LAZY);
    EXPECT_EQ(other.Open((dir / "missing").c_str(), RTLD_NOW, 0), 0);
    EXPECT_NE(other.m_error, 0);
    EXPECT_EQ(other.Disposition(), RTLD_LAZY);
    rvSharedLib::m_disposition = RTLD_NOW | RTLD_GLOBAL;
}

TEST(rvSharedLib, CloseSymbolsAndAssignment)
{
    rvSharedLib lib(kPlugin.c_str(), 0);
    EXPECT_EQ(lib.ResolveSymbol(nullptr), nullptr);
    EXPECT_EQ(lib.m_error, EINVAL);
    EXPECT_EQ(lib.Close(), 1);
    EXPECT_EQ(lib.Close(), 0);
    EXPECT_EQ(lib.m_error, 0);
    // A closed object hands dlsym the null handle: the global scope.
    EXPECT_NE(lib.ResolveSymbol("malloc"), nullptr);

    // Assignment opens the other object's library anew.
    rvSharedLib first(kPlugin.c_str(), 3);
    lib = first;
    first.Close();
    EXPECT_EQ(CallAnswer(lib), 42);
    rvSharedLib& alias = lib;
    lib = alias;
    EXPECT_EQ(lib.IsValid(), 1);
    lib = rvSharedLib();
    EXPECT_EQ(lib.IsValid(), 0) << "no name: \".so\" goes to the loader";
}

TEST(rvSharedLib, LoaderFailuresKeepErrno)
{
    tessaline::testing::ScopedSysCalls restore(Sys());
    static int messagesRead = 0;
    Sys().dlerror = [] {
        ++messagesRead;
        return static_cast<char*>(nullptr);
    };
    Sys().dlopen = [](const char*, int) -> void* {
        errno = ENOEXEC;
        return nullptr;
    };
    rvSharedLib lib(kPlugin.c_str(), 0);
    EXPECT_EQ(lib.IsValid(), 0);
    EXPECT_EQ(lib.m_error, ENOEXEC);
    EXPECT_EQ(messagesRead, 1) << "the loader's message is read once and dropped";

    // A failing dlclose still drops the handle.
    static int fake = 0;
    Sys().dlopen = [](const char*, int) -> void* { return &fake; };
    Sys().dlclose = [](void*) {
        errno = EBUSY;
        return -1;
    };
    ASSERT_EQ(lib.Open(nullptr, RTLD_NOW, 0), 1);
    EXPECT_EQ(lib.Close(), 0);
    EXPECT_EQ(lib.m_error, EBUSY);
    EXPECT_EQ(lib.IsValid(), 0);
}

}  // namespace
