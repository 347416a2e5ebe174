// A process that rewrites its configuration in a loop is killed at random
// moments. Whatever the moment, a whole file, the old one or the new one,
// stands under the configuration's name, also where that name is a link.
#include <chrono>
#include <memory>
#include <random>
#include <string>
#include <thread>

#include <signal.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <gtest/gtest.h>

#include "config/temp_dir.h"
#include "tessaline/config/rvConfig.h"

namespace {

using tessaline::test::ConfigDir;

constexpr int kSections = 10;
constexpr int kKeysPerSection = 100;
constexpr int kKillsPerMode = 200;
constexpr int kCalibrationRewrites = 5;
constexpr std::chrono::seconds kTimeLimit(60);

// Every key of the file takes a value of the set: 0 or 1.
void storeSet(rvConfig& config, int set)
{
    for (int s = 0; s < kSections; ++s) {
        const std::string section = "section" + std::to_string(s);
        for (int k = 0; k < kKeysPerSection; ++k) {
            const std::string value = (set == 0 ? "alpha-" : "beta-") + std::to_string(s * kKeysPerSection + k);
            config.PutValue(("key" + std::to_string(k)).c_str(), value.c_str(), section.c_str());
        }
    }
}

std::string initialFile()
{
    std::string text = "# rewritten until killed\n";
    for (int s = 0; s < kSections; ++s) {
        text += "\n# about section " + std::to_string(s) + "\n[section" + std::to_string(s) + "]\n";
        for (int k = 0; k < kKeysPerSection; ++k) {
            text += "key" + std::to_string(k) + " = initial\n";
        }
    }
    return text;
}

// The text without its closing identification line; "" when the file has
// none, which means it was cut short.
std::string body(const std::string& text)
{
    const std::string::size_type last = text.rfind("# Edited by Tessaline: ");
    if (text.empty() || text.back() != '\n' || last == std::string::npos || text.find('\n', last) != text.size() - 1) {
        return "";
    }
    return text.substr(0, last);
}

// Runs in the child, on the parent's loaded object: rewrites the file with
// the two value sets in turn until it is killed.
[[noreturn]] void rewriteUntilKilled(rvConfig& config, unsigned int backups)
{
    rvConfig::m_bBackups = backups;
    for (int set = 1;; set ^= 1) {
        storeSet(config, set);
        config.Flush(0);
    }
}

struct Mode {
    unsigned int backups;
    bool behindALink;
};

class CrashTest : public ::testing::TestWithParam<Mode> {
protected:
    void SetUp() override
    {
        if (GetParam().behindALink) {
            ASSERT_EQ(mkdir(m_dir.Path("conf").c_str(), 0700), 0);
            ASSERT_EQ(symlink("conf/app.ini", m_dir.Path("app.ini").c_str()), 0);
        }
        m_dir.Write(m_file, initialFile());
        m_config = std::make_unique<rvConfig>(m_dir.Path("app.ini").c_str(), rvConfig::OpenUpdate);
        const auto start = std::chrono::steady_clock::now();
        for (int i = 0; i < kCalibrationRewrites; ++i) {
            storeSet(*m_config, i % 2);
            ASSERT_EQ(m_config->Flush(0), 1u);
            m_sets[i % 2] = body(m_dir.Read(m_file));
        }
        m_rewriteTime = (std::chrono::steady_clock::now() - start) / kCalibrationRewrites;
        ASSERT_FALSE(m_sets[0].empty());
        ASSERT_FALSE(m_sets[1].empty());
    }

    bool whole(const std::string& name) const
    {
        const std::string text = body(m_dir.Read(name));
        return text == m_sets[0] || text == m_sets[1];
    }

    // Starts a rewriting child, kills it at a random moment of its first
    // rewrite, and waits for it.
    void killOneChild(unsigned int backups, std::mt19937& random)
    {
        const long longest = std::chrono::duration_cast<std::chrono::microseconds>(m_rewriteTime).count();
        const std::chrono::microseconds delay(std::uniform_int_distribution<long>(0, longest)(random));
        const pid_t child = fork();
        ASSERT_NE(child, -1);
        if (child == 0) {
            rewriteUntilKilled(*m_config, backups);
        }
        std::this_thread::sleep_for(delay);
        kill(child, SIGKILL);
        int status = 0;
        ASSERT_EQ(waitpid(child, &status, 0), child);
        ASSERT_TRUE(WIFSIGNALED(status) && WTERMSIG(status) == SIGKILL);
    }

    ConfigDir m_dir;
    // The file itself, where the link leads.
    const std::string m_file = GetParam().behindALink ? "conf/app.ini" : "app.ini";
    const std::string m_backup = GetParam().behindALink ? "conf/app.bak" : "app.bak";
    // Loaded once; each child rewrites with its own copy.
    std::unique_ptr<rvConfig> m_config;
    std::string m_sets[2];
    std::chrono::steady_clock::duration m_rewriteTime{};
};

TEST_P(CrashTest, KilledRewriteLeavesAWholeFileUnderItsName)
{
    const unsigned int backups = GetParam().backups;
    const unsigned int seed = std::random_device()();
    SCOPED_TRACE("seed " + std::to_string(seed));
    std::mt19937 random(seed);
    const auto deadline = std::chrono::steady_clock::now() + kTimeLimit;
    int kills = 0;
    for (; kills < kKillsPerMode && std::chrono::steady_clock::now() < deadline; ++kills) {
        killOneChild(backups, random);
        if (HasFatalFailure()) {
            return;
        }
        ASSERT_TRUE(whole(m_file)) << "after kill " << kills << ", " << m_dir.Read(m_file).size()
                                   << " bytes under the name";
        if (backups != 0 && m_dir.Exists(m_backup)) {
            ASSERT_TRUE(whole(m_backup)) << "after kill " << kills;
        }
    }
    EXPECT_EQ(kills, kKillsPerMode) << "too slow: the time limit ended the test";
    RecordProperty("kills", kills);
}

INSTANTIATE_TEST_SUITE_P(Backups, CrashTest, ::testing::Values(Mode{0, false}, Mode{1, false}, Mode{1, true}),
                         [](const ::testing::TestParamInfo<Mode>& info) {
                             return std::string(info.param.backups != 0 ? "On" : "Off") +
                                    (info.param.behindALink ? "BehindALink" : "");
                         });

}  // namespace
