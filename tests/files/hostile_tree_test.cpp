// Trees that try to lead rvUnlink and the tree copy outside: names whose text
// form reads as "..", symbolic links planted in the tree, and directories
// swapped for links by another thread while the walk works.
#include <atomic>
#include <chrono>
#include <filesystem>
#include <map>
#include <string>
#include <thread>
#include <vector>

#include <stdio.h>
#include <unistd.h>

#include <gtest/gtest.h>

#include "files/file_fixtures.h"
#include "support/capture_stderr.h"
#include "support/temp_dir.h"
#include "tessaline/files/rvCopy.h"

using namespace tessaline::test;

namespace {

using Snapshot = std::map<std::string, std::string>;

// Every file below `top` with its content.
Snapshot Take(const std::string& top)
{
    Snapshot files;
    for (const auto& entry : std::filesystem::recursive_directory_iterator(top)) {
        if (entry.is_regular_file()) {
            files[entry.path().string()] = Slurp(entry.path().string());
        }
    }
    return files;
}

// Files with the names a misled walk would find: f0..f3 and deeper/f0..f1.
void Populate(const std::string& directory, const std::string& content)
{
    for (int i = 0; i < 4; ++i) {
        Put(directory + "/f" + std::to_string(i), content);
    }
    Put(directory + "/deeper/f0", content);
    Put(directory + "/deeper/f1", content);
}

int CopyTree(const std::string& from, const std::string& to, unsigned move)
{
    return rvCopyFile(from.c_str(), to.c_str(), 1, 1, 0, move, nullptr, nullptr, 0644);
}

// Swaps each directory in turn for a link to its outside twin and back,
// until stopped.
class Swapper {
public:
    explicit Swapper(std::vector<std::pair<std::string, std::string>> swaps)
        : m_swaps(std::move(swaps)), m_thread([this] { Run(); })
    {
    }
    ~Swapper()
    {
        m_stop = true;
        m_thread.join();
    }
    Swapper(const Swapper&) = delete;
    Swapper& operator=(const Swapper&) = delete;

private:
    // Each state lasts long enough for a walk to resolve a path in it.
    static void Hold() { std::this_thread::sleep_for(std::chrono::microseconds(30)); }

    void Run()
    {
        while (!m_stop) {
            for (const auto& [inside, outside] : m_swaps) {
                const std::string away = inside + ".away";
                if (rename(inside.c_str(), away.c_str()) != 0) {
                    continue;
                }
                symlink(outside.c_str(), inside.c_str());
                Hold();
                unlink(inside.c_str());
                rename(away.c_str(), inside.c_str());
                Hold();
            }
        }
    }

    std::vector<std::pair<std::string, std::string>> m_swaps;
    std::atomic<bool> m_stop{false};
    std::thread m_thread;
};

}  // namespace

TEST(HostileTree, NamesThatReadAsParentAreLeftAlone)
{
    TempDir dir;
    Populate(dir / "outside", "outside");
    const Snapshot outside = Take(dir / "outside");
    // "..." reads as file ".." with an empty extension; a backslash as "/".
    Put(dir / "tree/...", "odd");
    Put(dir / "tree/..\\outside\\f0", "odd");
    Put(dir / "tree/plain", "plain");

    EXPECT_EQ(1, CopyTree(dir / "tree", dir / "copy", 0));
    EXPECT_EQ("plain", Slurp(dir / "copy/plain"));
    EXPECT_FALSE(Exists(dir / "copy/deeper"));

    EXPECT_EQ(1, rvUnlink((dir / "tree").c_str(), 1));
    EXPECT_EQ(outside, Take(dir / "outside"));
    EXPECT_TRUE(Exists(dir / "tree/...")) << "what the walk cannot name stays";
}

TEST(HostileTree, PlantedLinksAreReadButNeverWrittenOrEmptied)
{
    TempDir dir;
    Populate(dir / "outside", "outside");
    const Snapshot outside = Take(dir / "outside");

    // The source side reads through a link, as always; a move leaves what
    // it reached that way.
    Put(dir / "src/own", "own");
    symlink((dir / "outside").c_str(), (dir / "src/linked").c_str());
    EXPECT_EQ(7, CopyTree(dir / "src", dir / "moved", 1));
    EXPECT_EQ("outside", Slurp(dir / "moved/linked/deeper/f1"));
    EXPECT_FALSE(Exists(dir / "src/own"));
    EXPECT_EQ(outside, Take(dir / "outside"));

    // The target side never writes through one.
    Populate(dir / "new", "new");
    Put(dir / "dst/plain", "old");
    symlink((dir / "outside").c_str(), (dir / "dst/deeper").c_str());
    symlink((dir / "outside/f0").c_str(), (dir / "dst/f0").c_str());
    EXPECT_EQ(3, CopyTree(dir / "new", dir / "dst", 0)) << "f1..f3 only";
    EXPECT_EQ("new", Slurp(dir / "dst/f3"));
    EXPECT_EQ(outside, Take(dir / "outside"));
}

TEST(HostileTree, DirectoriesSwappedForLinksDuringTheWalk)
{
    using Clock = std::chrono::steady_clock;
    const auto deadline = Clock::now() + std::chrono::milliseconds(1500);
    constexpr int kMaxRounds = 150;
    int rounds = 0;
    for (; rounds < kMaxRounds && Clock::now() < deadline; ++rounds) {
        TempDir dir;
        Populate(dir / "outside", "outside");
        Populate(dir / "outside/deeper", "outside deeper");
        const Snapshot outside = Take(dir / "outside");
        Populate(dir / "tree/sub", "inside");
        Populate(dir / "tree/src/sub", "inside");
        {
            Swapper swapper({{dir / "tree/sub", dir / "outside"},
                             {dir / "tree/sub/deeper", dir / "outside/deeper"},
                             {dir / "tree/src/sub", dir / "outside"},
                             {dir / "tree/dst/sub", dir / "outside"},
                             {dir / "tree/dst/sub/deeper", dir / "outside/deeper"}});
            CopyTree(dir / "tree/src", dir / "tree/dst", 1);
            CaptureStderr quiet;
            rvUnlink((dir / "tree/sub").c_str(), 1);
        }
        ASSERT_EQ(outside, Take(dir / "outside")) << "round " << rounds;
    }
    EXPECT_GT(rounds, 0);
}
