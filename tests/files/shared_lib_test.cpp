// Loading shared objects through rvSharedLib.
#include <dlfcn.h>
#include <errno.h>

#include <filesystem>
#include <string>

#include <gtest/gtest.h>

#include "support/temp_dir.h"
#include "tessaline/files/rvSharedLib.h"

namespace {

using tessaline::test::TempDir;

const std::string kPluginDir = TESSALINE_TEST_PLUGIN_DIR;
const std::string kPlugin = kPluginDir + "/libtessaline_plugin";

using AnswerFunction = int (*)();

int CallAnswer(rvSharedLib& lib)
{
    auto answer = reinterpret_cast<AnswerFunction>(lib.ProcAddr("tessaline_plugin_answer"));
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

    // A copy of the test plugin under another name.
    std::string CopyPlugin(const std::string& name)
    {
        std::string target = m_dir / name;
        std::filesystem::copy_file(kPlugin + ".so", target);
        return target;
    }

    TempDir m_dir;
};

TEST_F(rvSharedLibTest, AddsTheDefaultExtension)
{
    rvSharedLib lib(kPlugin.c_str(), 7);
    ASSERT_EQ(lib.IsValid(), 1) << dlerror();
    EXPECT_STREQ(lib, kPlugin.c_str());
    EXPECT_STREQ(lib.m_name.Ext(), "");
    EXPECT_EQ(lib.m_flags, 7);
    EXPECT_EQ(lib.Disposition(), RTLD_NOW | RTLD_GLOBAL);
    EXPECT_EQ(CallAnswer(lib), 42);

    // A name with an extension of its own goes unchanged.
    rvSharedLib versioned(CopyPlugin("libx.so.2").c_str(), 0);
    EXPECT_EQ(versioned.IsValid(), 1);
    rvSharedLib other(CopyPlugin("libx.bin").c_str(), 0);
    EXPECT_EQ(other.IsValid(), 1);
    rvSharedLib missing((m_dir / "libx").c_str(), 0);
    EXPECT_EQ(missing.IsValid(), 0);
    EXPECT_STREQ(missing, "");

    rvSharedLib::DefaultExtension("dll");
    CopyPlugin("libx.dll");
    rvSharedLib dll;
    EXPECT_EQ(dll.Open((m_dir / "libx").c_str(), RTLD_NOW, 0), 1);
    EXPECT_STREQ(dll, (m_dir / "libx.dll").c_str());
}

TEST_F(rvSharedLibTest, DefaultExtension)
{
    EXPECT_STREQ(rvSharedLib::DefaultExtension(), "so");
    EXPECT_STREQ(rvSharedLib::DefaultExtension("abcdefghijklmnopqrst"), "abcdefghijklmno");
    EXPECT_EQ(rvSharedLib::DefaultExtension(), rvSharedLib::m_defLibExt);
    EXPECT_STREQ(rvSharedLib::DefaultExtension(nullptr), "");
}

TEST_F(rvSharedLibTest, DispositionFollowsSuccessfulOpens)
{
    rvSharedLib lib;
    EXPECT_EQ(lib.Open(kPlugin.c_str(), RTLD_LAZY, 0), 1);
    EXPECT_EQ(lib.Disposition(), RTLD_LAZY);
    EXPECT_EQ(lib.Close(), 1);

    errno = 0;
    EXPECT_EQ(lib.Open((m_dir / "missing").c_str(), RTLD_NOW, 0), 0);
    EXPECT_EQ(lib.m_handle, nullptr);
    EXPECT_NE(lib.m_error, 0);
    EXPECT_EQ(lib.Disposition(), RTLD_LAZY);

    lib.Disposition(RTLD_NOW);
    EXPECT_EQ(rvSharedLib::m_disposition, RTLD_NOW);
}

TEST_F(rvSharedLibTest, CloseAndReopen)
{
    rvSharedLib lib(kPlugin.c_str(), 0);
    ASSERT_EQ(lib.IsValid(), 1);
    EXPECT_EQ(lib.Close(), 1);
    EXPECT_EQ(lib.IsValid(), 0);
    EXPECT_EQ(lib.Close(), 0);
    EXPECT_EQ(lib.m_error, 0);

    EXPECT_EQ(lib.Open(nullptr, RTLD_NOW, 0), 1);
    EXPECT_EQ(CallAnswer(lib), 42);

    rvSharedLib none(nullptr, 0);
    EXPECT_EQ(none.IsValid(), 0);
    EXPECT_STREQ(none, "");
    EXPECT_EQ(none.Close(), 0);
}

TEST_F(rvSharedLibTest, Symbols)
{
    struct CountingLib : rvSharedLib {
        using rvSharedLib::rvSharedLib;
        void* ResolveSymbol(const char* symbol) override
        {
            ++lookups;
            return rvSharedLib::ResolveSymbol(symbol);
        }
        int lookups = 0;
    };
    CountingLib lib(kPlugin.c_str(), 0);
    EXPECT_EQ(CallAnswer(lib), 42);
    EXPECT_EQ(lib.lookups, 1);
    EXPECT_EQ(lib.m_error, 0);

    EXPECT_EQ(lib.ResolveSymbol("no_such_symbol"), nullptr);
    EXPECT_EQ(lib.ResolveSymbol(nullptr), nullptr);
    EXPECT_EQ(lib.m_error, EINVAL);

    // A closed object hands dlsym the null handle, the global scope.
    lib.Close();
    EXPECT_NE(lib.ResolveSymbol("malloc"), nullptr);
}

TEST_F(rvSharedLibTest, AssignmentOpensAnew)
{
    rvSharedLib first(kPlugin.c_str(), 3);
    rvSharedLib second;
    second = first;
    ASSERT_EQ(second.IsValid(), 1);
    EXPECT_EQ(second.m_flags, 0);
    EXPECT_STREQ(second, (kPlugin + ".so").c_str());
    // Each holds its own reference.
    first.Close();
    EXPECT_EQ(CallAnswer(second), 42);

    rvSharedLib& alias = second;
    second = alias;
    EXPECT_EQ(second.IsValid(), 1);

    // No name: ".so" goes to the loader.
    rvSharedLib unnamed;
    second = unnamed;
    EXPECT_EQ(second.IsValid(), 0);
}

}  // namespace
