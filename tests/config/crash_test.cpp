// A process that rewrites its configuration in a loop is killed at random
// moments. Whatever the moment, a whole file, the old one or the new one,
// stands under the configuration's name, also where that name is a link.
#include <chrono>
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

constexpr int kKillsPerMode = 200;
constexpr int kCalibrationRewrites = 5;
constexpr std::chrono::seconds kTimeLimit(60);

// Every key of ten sections of 100 keys takes a value of the set: 0 or 1.
void storeSet(rvConfig& config, int set)
{
    for (int n = 0; n < 1000; ++n) {
        const std::string value = (set == 0 ? "alpha-" : "beta-") + std::to_string(n);
        config.PutValue(("key" + std::to_string(n % 100)).c_str(), value.c_str(),
                        ("section" + std::to_string(n / 100)).c_str());
    }
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

struct Mode {
    unsigned int backups;
    bool behindALink;
};

class CrashTest : public ::testing::TestWithParam<Mode> {};

TEST_P(CrashTest, KilledRewriteLeavesAWholeFileUnderItsName)
{
    const unsigned int backups = GetParam().backups;
    ConfigDir dir;
    // The file itself, where the link leads.
    const std::string file = GetParam().behindALink ? "conf/app.ini" : "app.ini";
    const std::string backup = GetParam().behindALink ? "conf/app.bak" : "app.bak";
    if (GetParam().behindALink) {
        ASSERT_EQ(mkdir(dir.Path("conf").c_str(), 0700), 0);
        ASSERT_EQ(symlink("conf/app.ini", dir.Path("app.ini").c_str()), 0);
    }
    std::string text = "# rewritten until killed\n";
    for (int s = 0; s < 10; ++s) {
        text += "\n# about section " + std::to_string(s) + "\n[section" + std::to_string(s) + "]\n";
    }
    dir.Write(file, text);
    // Loaded once; each child rewrites with its own copy.
    rvConfig config(dir.Path("app.ini").c_str(), rvConfig::OpenUpdate);
    std::string sets[2];
    const auto start = std::chrono::steady_clock::now();
    for (int i = 0; i < kCalibrationRewrites; ++i) {
        storeSet(config, i % 2);
        ASSERT_EQ(config.Flush(0), 1u);
        sets[i % 2] = body(dir.Read(file));
    }
    const auto rewriteTime = (std::chrono::steady_clock::now() - start) / kCalibrationRewrites;
    ASSERT_FALSE(sets[0].empty() || sets[1].empty());
    const auto whole = [&](const std::string& name) {
        const std::string found = body(dir.Read(name));
        return found == sets[0] || found == sets[1];
    };

    const unsigned int seed = std::random_device()();
    SCOPED_TRACE("seed " + std::to_string(seed));
    std::mt19937 random(seed);
    const long longest = std::chrono::duration_cast<std::chrono::microseconds>(rewriteTime).count();
    const auto deadline = std::chrono::steady_clock::now() + kTimeLimit;
    int kills = 0;
    for (; kills < kKillsPerMode && std::chrono::steady_clock::now() < deadline; ++kills) {
        const pid_t child = fork();
        ASSERT_NE(child, -1);
        if (child == 0) {
            rvConfig::m_bBackups = backups;
            for (int set = 1;; set ^= 1) {
                storeSet(config, set);
                config.Flush(0);
            }
        }
        // Killed at a random moment of its first rewrite.
        std::this_thread::sleep_for(std::chrono::microseconds(std::uniform_int_distribution<long>(0, longest)(random)));
        kill(child, SIGKILL);
        int status = 0;
        ASSERT_EQ(waitpid(child, &status, 0), child);
        ASSERT_TRUE(WIFSIGNALED(status) && WTERMSIG(status) == SIGKILL);
        ASSERT_TRUE(whole(file)) << "after kill " << kills << ", " << dir.Read(file).size() << " bytes under the name";
        if (backups != 0 && dir.Exists(backup)) {
            ASSERT_TRUE(whole(backup)) << "after kill " << kills;
        }
    }
    EXPECT_EQ(kills, kKillsPerMode) << "too slow: the time limit ended the test";
}

INSTANTIATE_TEST_SUITE_P(Backups, CrashTest, ::testing::Values(Mode{0, false}, Mode{1, false}, Mode{1, true}),
                         [](const ::testing::TestParamInfo<Mode>& info) {
                             return std::string(info.param.backups != 0 ? "On" : "Off") +
                                    (info.param.behindALink ? "BehindALink" : "");
                         });

}  // namespace
