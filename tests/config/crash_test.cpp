// A process that rewrites its configuration in a loop is killed at random
// moments. Whatever the moment, a whole file, the old one or the new one,
// stands under the configuration's name.
#include <chrono>
#include <random>
#include <string>
#include <thread>

#include <fcntl.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <gtest/gtest.h>

#include "config/temp_dir.h"
#include "tessaline/config/rvConfig.h"

namespace {

using tessaline::test::TempDir;

constexpr int kSections = 10;
constexpr int kKeysPerSection = 100;
constexpr int kKillsPerMode = 200;
constexpr int kCalibrationFlushes = 5;
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
    if (text.empty() || text.back() != '\n' || last == std::string::npos ||
        text.find('\n', last) != text.size() - 1) {
        return "";
    }
    return text.substr(0, last);
}

// Runs in the child: loads, says so on `readyFd`, and rewrites the file
// with the two value sets in turn until it is killed.
[[noreturn]] void rewriteUntilKilled(const std::string& path, unsigned int backups, int readyFd)
{
    rvConfig::m_bBackups = backups;
    rvConfig config(path.c_str(), rvConfig::OpenUpdate);
    if (write(readyFd, "r", 1) != 1) {
        _exit(1);
    }
    for (int set = 0;; set ^= 1) {
        storeSet(config, set);
        config.Flush(0);
    }
}

class CrashTest : public ::testing::TestWithParam<unsigned int> {
protected:
    void SetUp() override
    {
        m_path = m_dir.Write("app.ini", initialFile());
        rvConfig config(m_path.c_str(), rvConfig::OpenUpdate);
        const auto start = std::chrono::steady_clock::now();
        for (int i = 0; i < kCalibrationFlushes; ++i) {
            storeSet(config, i % 2);
            ASSERT_EQ(config.Flush(0), 1u);
            m_sets[i % 2] = body(m_dir.Read("app.ini"));
        }
        m_flushTime = (std::chrono::steady_clock::now() - start) / kCalibrationFlushes;
        ASSERT_FALSE(m_sets[0].empty());
        ASSERT_FALSE(m_sets[1].empty());
    }

    bool whole(const std::string& name) const
    {
        const std::string text = body(m_dir.Read(name));
        return text == m_sets[0] || text == m_sets[1];
    }

    // Starts a rewriting child, kills it after a random delay of up to two
    // rewrites, and waits for it.
    void killOneChild(unsigned int backups, std::mt19937& random)
    {
        int ready[2];
        ASSERT_EQ(pipe2(ready, O_CLOEXEC), 0);
        const pid_t child = fork();
        ASSERT_NE(child, -1);
        if (child == 0) {
            close(ready[0]);
            rewriteUntilKilled(m_path, backups, ready[1]);
        }
        close(ready[1]);
        char byte;
        const bool loaded = read(ready[0], &byte, 1) == 1;
        close(ready[0]);
        std::uniform_int_distribution<long> delay(0, 2 * std::chrono::duration_cast<std::chrono::microseconds>(m_flushTime).count());
        std::this_thread::sleep_for(std::chrono::microseconds(delay(random)));
        kill(child, SIGKILL);
        int status = 0;
        ASSERT_EQ(waitpid(child, &status, 0), child);
        ASSERT_TRUE(loaded);
        ASSERT_TRUE(WIFSIGNALED(status) && WTERMSIG(status) == SIGKILL);
    }

    TempDir m_dir;
    std::string m_path;
    std::string m_sets[2];
    std::chrono::steady_clock::duration m_flushTime{};
};

TEST_P(CrashTest, KilledRewriteLeavesAWholeFileUnderItsName)
{
    const unsigned int backups = GetParam();
    std::mt19937 random(::testing::UnitTest::GetInstance()->random_seed());
    const auto deadline = std::chrono::steady_clock::now() + kTimeLimit;
    int kills = 0;
    for (; kills < kKillsPerMode && std::chrono::steady_clock::now() < deadline; ++kills) {
        killOneChild(backups, random);
        if (HasFatalFailure()) {
            return;
        }
        ASSERT_TRUE(whole("app.ini")) << "after kill " << kills << ", " << m_dir.Read("app.ini").size()
                                      << " bytes under the name";
    }
    EXPECT_EQ(kills, kKillsPerMode) << "too slow: the time limit ended the test";
    RecordProperty("kills", kills);
}

INSTANTIATE_TEST_SUITE_P(Backups, CrashTest, ::testing::Values(0u, 1u),
                         [](const ::testing::TestParamInfo<unsigned int>& info) {
                             return info.param != 0 ? std::string("On") : std::string("Off");
                         });

}  // namespace
