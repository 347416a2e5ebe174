// Loading shared objects through rvSharedLib.
#include <dlfcn.h>
#include <errno.h>

#include <filesystem>
#include <string>

#include <gtest/gtest.h>

#include "files/sys.h"
#include "support/scoped_sys_calls.h"
#include "support/temp_dir.h"
#include "tessaline/files/rvSharedLib.h"

namespace {

const std::string kPlugin = TESSALINE_TEST_PLUGIN_DIR "/libtessaline_plugin";

int CallAnswer(rvSharedLib& lib)
{
    auto answer = reinterpret_cast<int (*)()>(lib.ProcAddr("tessaline_plugin_answer"));
    return answer ? answer() : -1;
}

// The class-wide statics go back to their first values after each test.
class rvSharedLibTest : public ::testing::Test {
protected:
    void TearDown() override
    {
        rvSharedLib::m_disposition = RTLD_NOW | RTLD_GLOBAL;
        rvSharedLib::DefaultExtension("so");
    }

    std::string CopyPlugin(const std::string& name)
    {
        std::filesystem::copy_file(kPlugin + ".so", m_dir / name);
        return m_dir / name;
    }

    tessaline::test::TempDir m_dir;
};

TEST_F(rvSharedLibTest, DefaultExtension)
{
    rvSharedLib lib(kPlugin.c_str(), 7);
    ASSERT_EQ(lib.IsValid(), 1);
    EXPECT_STREQ(lib, kPlugin.c_str());
    EXPECT_EQ(lib.Disposition(), RTLD_NOW | RTLD_GLOBAL);
    EXPECT_EQ(CallAnswer(lib), 42);

    // A name with an extension of its own goes unchanged.
    EXPECT_EQ(rvSharedLib(CopyPlugin("libx.so.2").c_str(), 0).IsValid(), 1);
    EXPECT_EQ(rvSharedLib(CopyPlugin("libx.bin").c_str(), 0).IsValid(), 1);
    rvSharedLib missing((m_dir / "libx").c_str(), 0);
    EXPECT_EQ(missing.IsValid(), 0);
    EXPECT_STREQ(missing, "");

    CopyPlugin("libx.dll");
    EXPECT_STREQ(rvSharedLib::DefaultExtension("dll"), "dll");
    EXPECT_EQ(missing.Open((m_dir / "libx").c_str(), RTLD_NOW, 0), 1);
    EXPECT_STREQ(missing, (m_dir / "libx.dll").c_str());

    EXPECT_STREQ(rvSharedLib::DefaultExtension("abcdefghijklmnopqrst"), "abcdefghijklmno");
    EXPECT_STREQ(rvSharedLib::DefaultExtension(nullptr), "");
}

TEST_F(rvSharedLibTest, DispositionFollowsSuccessfulOpens)
{
    rvSharedLib lib;
    EXPECT_EQ(lib.Open(kPlugin.c_str(), RTLD_LAZY, 0), 1);
    EXPECT_EQ(lib.Disposition(), RTLD_LAZY);

    EXPECT_EQ(lib.Open((m_dir / "missing").c_str(), RTLD_NOW, 0), 0);
    EXPECT_EQ(lib.IsValid(), 0);
    EXPECT_NE(lib.m_error, 0);
    EXPECT_EQ(lib.Disposition(), RTLD_LAZY);
}

TEST_F(rvSharedLibTest, CloseSymbolsAndReopen)
{
    rvSharedLib lib(kPlugin.c_str(), 0);
    EXPECT_EQ(lib.ResolveSymbol("no_such_symbol"), nullptr);
    EXPECT_EQ(lib.ResolveSymbol(nullptr), nullptr);
    EXPECT_EQ(lib.m_error, EINVAL);

    EXPECT_EQ(lib.Close(), 1);
    EXPECT_EQ(lib.Close(), 0);
    EXPECT_EQ(lib.m_error, 0);
    // A closed object hands dlsym the null handle: the global scope.
    EXPECT_NE(lib.ResolveSymbol("malloc"), nullptr);

    EXPECT_EQ(lib.Open(nullptr, RTLD_NOW, 0), 1);
    EXPECT_EQ(CallAnswer(lib), 42);
    EXPECT_EQ(rvSharedLib(nullptr, 0).IsValid(), 0);
}

TEST_F(rvSharedLibTest, AssignmentOpensAnew)
{
    rvSharedLib first(kPlugin.c_str(), 3);
    rvSharedLib second;
    second = first;
    ASSERT_EQ(second.IsValid(), 1);
    EXPECT_EQ(second.m_flags, 0);
    first.Close();
    EXPECT_EQ(CallAnswer(second), 42);

    rvSharedLib& alias = second;
    second = alias;
    EXPECT_EQ(second.IsValid(), 1);
    // No name: ".so" goes to the loader.
    second = rvSharedLib();
    EXPECT_EQ(second.IsValid(), 0);
}

TEST_F(rvSharedLibTest, LoaderFailuresKeepErrno)
{
    tessaline::testing::ScopedSysCalls restore(tessaline::files::Sys());
    static int messagesRead = 0;
    tessaline::files::Sys().dlerror = [] {
        ++messagesRead;
        return static_cast<char*>(nullptr);
    };
    tessaline::files::Sys().dlopen = [](const char*, int) -> void* {
        errno = ENOEXEC;
        return nullptr;
    };
    rvSharedLib lib(kPlugin.c_str(), 0);
    EXPECT_EQ(lib.IsValid(), 0);
    EXPECT_EQ(lib.m_error, ENOEXEC);
    EXPECT_EQ(messagesRead, 1) << "the loader's message is read once and dropped";

    // A failing dlclose still drops the handle.
    static int fake = 0;
    tessaline::files::Sys().dlopen = [](const char*, int) -> void* { return &fake; };
    tessaline::files::Sys().dlclose = [](void*) {
        errno = EBUSY;
        return -1;
    };
    ASSERT_EQ(lib.Open(nullptr, RTLD_NOW, 0), 1);
    EXPECT_EQ(lib.Close(), 0);
    EXPECT_EQ(lib.m_error, EBUSY);
    EXPECT_EQ(lib.IsValid(), 0);
}

}  // namespace
