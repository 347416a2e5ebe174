// Trees that try to lead rvUnlink and the tree copy outside: names whose text
// form reads as "..", symbolic links planted in the tree, directories swapped
// for links by another thread while the walk works, trees as deep as the
// path limit allows, and links that lead back up the tree. Walks that used
// to crash run in a child process, so a crash fails the test.
#include <array>
#include <atomic>
#include <chrono>
#include <thread>

#include <limits.h>
#include <pthread.h>
#include <stdio.h>
#include <sys/resource.h>
#include <sys/wait.h>

#include "files/file_fixtures.h"
#include "support/capture_stderr.h"
#include "tessaline/files/rvCopy.h"

using namespace tessaline::test;

namespace {

// Files with the names a misled walk would find: f0..f3 and deeper/f0..f1.
void Populate(const std::string& directory, const std::string& content)
{
    for (const char* name : {"f0", "f1", "f2", "f3", "deeper/f0", "deeper/f1"}) {
        Put(directory + "/" + name, content);
    }
}

int CopyTree(const std::string& from, const std::string& to, unsigned move)
{
    return rvCopyFile(from.c_str(), to.c_str(), 1, 1, 0, move, nullptr, nullptr, 0644);
}

using Results = std::array<int, 6>;

// Runs `walks` in a child process on a thread with a 256 KiB stack and at
// most 128 descriptors, as a small host thread would; the results it stores,
// or -1 each when the child dies or runs for two minutes.
Results InSmallThread(void (*walks)(Results*))
{
    Results results;
    results.fill(-1);
    int channel[2];
    if (pipe(channel) != 0) {
        return results;
    }
    const pid_t child = fork();
    if (child == 0) {
        alarm(120);  // a walk that never ends fails too
        const struct rlimit descriptors = {128, 128};
        setrlimit(RLIMIT_NOFILE, &descriptors);
        pthread_attr_t attributes;
        pthread_attr_init(&attributes);
        pthread_attr_setstacksize(&attributes, 256 * 1024);
        static Results found;
        static void (*run)(Results*) = walks;
        found.fill(0);
        pthread_t thread;
        const auto body = [](void*) -> void* {
            run(&found);
            return nullptr;
        };
        if (pthread_create(&thread, &attributes, body, nullptr) != 0 || pthread_join(thread, nullptr) != 0) {
            _exit(2);
        }
        _exit(write(channel[1], found.data(), sizeof found) == sizeof found ? 0 : 1);
    }
    close(channel[1]);
    if (read(channel[0], results.data(), sizeof results) != sizeof results) {
        results.fill(-1);
    }
    close(channel[0]);
    waitpid(child, nullptr, 0);
    return results;
}

// The trees' places, fixed before the fork.
std::string g_top;
int g_levels = 0;

}  // namespace

TEST(HostileTree, DeepestTreeOnASmallStack)
{
    // Thousands of directories: in memory where the system offers it.
    TempDir dir(access("/dev/shm", W_OK) == 0 ? "/dev/shm/" : ::testing::TempDir());
    // "s/a/a/.../f": a file at every level, the deepest one exactly at the
    // path limit, so that a target name one character longer passes it.
    g_top = dir / (dir.path().size() % 2 == 0 ? "ss" : "s");
    g_levels = static_cast<int>((PATH_MAX - 1 - 2 - g_top.size()) / 2);
    ASSERT_EQ(0, mkdir(g_top.c_str(), 0755));
    int fd = open(g_top.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    for (int level = 0; level <= g_levels; ++level) {
        close(openat(fd, "f", O_WRONLY | O_CREAT | O_CLOEXEC, 0644));
        if (level < g_levels) {
            mkdirat(fd, "a", 0755);
            const int deeper = openat(fd, "a", O_RDONLY | O_DIRECTORY | O_CLOEXEC);
            close(fd);
            fd = deeper;
        }
    }
    close(fd);
    ASSERT_EQ(PATH_MAX - 1, static_cast<int>(g_top.size()) + 2 * g_levels + 2);

    const auto results = InSmallThread([](Results* found) {
        const std::string same = g_top.substr(0, g_top.size() - 1) + "d";
        const std::string longer = g_top + "d";
        (*found)[0] = rvCopyFile(g_top.c_str(), same.c_str(), 1, 1, 0, 0, nullptr, nullptr, 0644);
        (*found)[1] = rvCopyFile(g_top.c_str(), longer.c_str(), 1, 1, 0, 0, nullptr, nullptr, 0644);
        (*found)[2] = CompareDirectoriesByFileSize(g_top.c_str(), same.c_str());
        (*found)[3] = CompareDirectoriesByFileSize(g_top.c_str(), longer.c_str());
        (*found)[4] = rvUnlink(same.c_str(), 1);
        (*found)[5] = rvUnlink(longer.c_str(), 1) + rvUnlink(g_top.c_str(), 1);
    });
    const int files = g_levels + 1;
    EXPECT_EQ((Results{files, files - 1, 1, 0, files, files - 1 + files}), results)
        << "copies, comparisons and removals of " << files << " levels; the deepest target name passes the limit";
    EXPECT_FALSE(Exists(g_top)) << "all levels removed";
}

TEST(HostileTree, DirectoriesOnThePathAreNotEnteredAgain)
{
    TempDir dir;
    g_top = dir.path();
    Put(dir / "src/f", "file");
    Put(dir / "src/sub/g", "deeper");
    Put(dir / "src/x*/f", "x");  // a directory whose name reads as a pattern of its own directory
    symlink(".", (dir / "src/loop").c_str());
    symlink("..", (dir / "src/sub/up").c_str());
    symlink("../sub", (dir / "src/sub/self").c_str());
    Put(dir / "t/f", "in");                    // copied into itself
    mkfifo((dir / "src/pipe").c_str(), 0644);  // copied as its size, without waiting for a writer

    const auto results = InSmallThread([](Results* found) {
        const std::string src = g_top + "/src";
        (*found)[0] = rvCopyFile(src.c_str(), (g_top + "/dst").c_str(), 1, 1, 0, 0, nullptr, nullptr, 0644);
        (*found)[1] = CompareDirectoriesByFileSize(src.c_str(), (g_top + "/dst").c_str());
        (*found)[2] =
            rvCopyFile((g_top + "/t").c_str(), (g_top + "/t/copy").c_str(), 1, 1, 0, 0, nullptr, nullptr, 0644);
        CaptureStderr quiet;
        (*found)[3] = rvUnlink(src.c_str(), 1);
    });
    EXPECT_EQ((Results{3, 0, 1, 3, 0, 0}), results);
    // Each link back up and the pattern member become an empty directory.
    EXPECT_EQ(
        (std::set<std::string>{"f=file", "pipe=", "sub/", "sub/g=deeper", "loop/", "sub/up/", "sub/self/", "x*/"}),
        Tree(dir / "dst"));
    EXPECT_EQ((std::set<std::string>{"f=in", "copy/", "copy/f=in", "copy/copy/"}), Tree(dir / "t"));
    EXPECT_EQ((std::set<std::string>{"x*/", "x*/f=x"}), Tree(dir / "src"))
        << "links go as links; the pattern member stays";
}

TEST(HostileTree, NamesAndPlantedLinksLeadNowhereOutside)
{
    TempDir dir;
    Populate(dir / "outside", "outside");
    const auto outside = Tree(dir / "outside");
    // "..." reads as file ".." with an empty extension; a backslash as "/".
    Put(dir / "src/...", "odd");
    Put(dir / "src/..\\outside\\f0", "odd");
    Put(dir / "src/own", "own");
    symlink((dir / "outside").c_str(), (dir / "src/linked").c_str());

    // The source side reads through a link, as always; a move leaves what
    // it reached that way, and the odd names are not copied.
    EXPECT_EQ(7, CopyTree(dir / "src", dir / "moved", 1));
    EXPECT_EQ("outside", Slurp(dir / "moved/linked/deeper/f1"));
    EXPECT_FALSE(Exists(dir / "src/own") || Exists(dir / "moved/deeper"));
    EXPECT_EQ(outside, Tree(dir / "outside"));

    // The target side never writes through one.
    Populate(dir / "new", "new");
    Put(dir / "dst/plain", "old");
    symlink((dir / "outside").c_str(), (dir / "dst/deeper").c_str());
    symlink((dir / "outside/f0").c_str(), (dir / "dst/f0").c_str());
    EXPECT_EQ(3, CopyTree(dir / "new", dir / "dst", 0)) << "f1..f3 only";
    EXPECT_EQ("new", Slurp(dir / "dst/f3"));

    // Removal takes the link as a link and leaves what it cannot name.
    Put(dir / "src/plain", "plain");
    EXPECT_EQ(1, rvUnlink((dir / "src").c_str(), 1));
    EXPECT_TRUE(Exists(dir / "src/...") && !Exists(dir / "src/linked"));
    EXPECT_EQ(outside, Tree(dir / "outside"));
}

TEST(HostileTree, DirectoriesSwappedForLinksDuringTheWalk)
{
    using Clock = std::chrono::steady_clock;
    const auto deadline = Clock::now() + std::chrono::milliseconds(1500);
    int rounds = 0;
    for (; rounds < 150 && Clock::now() < deadline; ++rounds) {
        TempDir dir;
        Populate(dir / "outside", "outside");
        Populate(dir / "outside/deeper", "outside deeper");
        const auto outside = Tree(dir / "outside");
        Populate(dir / "tree/sub", "inside");
        Populate(dir / "tree/src/sub", "inside");
        const std::pair<std::string, std::string> swaps[] = {{dir / "tree/sub", dir / "outside"},
                                                             {dir / "tree/sub/deeper", dir / "outside/deeper"},
                                                             {dir / "tree/src/sub", dir / "outside"},
                                                             {dir / "tree/dst/sub", dir / "outside"},
                                                             {dir / "tree/dst/sub/deeper", dir / "outside/deeper"}};
        // Each directory in turn becomes a link to its outside twin and back,
        // each state lasting long enough for a walk to resolve a path in it.
        std::atomic<bool> stop{false};
        std::thread swapper([&] {
            while (!stop) {
                for (const auto& [inside, twin] : swaps) {
                    const std::string away = inside + ".away";
                    if (rename(inside.c_str(), away.c_str()) == 0) {
                        symlink(twin.c_str(), inside.c_str());
                        std::this_thread::sleep_for(std::chrono::microseconds(30));
                        unlink(inside.c_str());
                        rename(away.c_str(), inside.c_str());
                        std::this_thread::sleep_for(std::chrono::microseconds(30));
                    }
                }
            }
        });
        CopyTree(dir / "tree/src", dir / "tree/dst", 1);
        {
            CaptureStderr quiet;
            rvUnlink((dir / "tree/sub").c_str(), 1);
        }
        stop = true;
        swapper.join();
        ASSERT_EQ(outside, Tree(dir / "outside")) << "round " << rounds;
    }
    EXPECT_GT(rounds, 0);
}
