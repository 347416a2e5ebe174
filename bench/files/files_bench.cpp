// The file services against the tools and library calls a host would use
// otherwise, in one run: copying one large file, copying and removing trees
// of small files, and walking a directory by pattern. The command-line peers
// (cp, rm -rf) run as child processes started without a shell, so every
// figure here is wall-clock time.
//
// Groups (see common/bench_names.h):
//   files_copy_large/<impl>/256MiB
//   files_tree_copy/<impl>/<dirs>x<files>    files of 1 KiB, three sizes
//   files_tree_remove/<impl>/<dirs>x<files>
//   files_walk/<impl>/<entries>              pattern "*7.txt", three sizes
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <string>
#include <thread>
#include <vector>

#include <dirent.h>
#include <fnmatch.h>
#include <glob.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <benchmark/benchmark.h>

#include "common/bench_names.h"
#include "tessaline/tessaline.h"

extern char** environ;

namespace fs = std::filesystem;

namespace {

constexpr size_t kLargeFileBytes = size_t{256} << 20;
constexpr size_t kTreeFileBytes = 1024;
// One name in ten ends in 7 before its extension.
constexpr const char* kWalkPattern = "*7.txt";

struct TreeSize {
    int directories;
    int files;
    std::string Label() const { return std::to_string(directories) + "x" + std::to_string(files); }
};

const TreeSize kTreeSizes[] = {{10, 10}, {10, 100}, {100, 100}};
const int kWalkSizes[] = {1000, 10000, 100000};

// The inputs, made on first use under the temporary directory and removed
// at exit.
class Inputs {
public:
    static Inputs& Get()
    {
        static Inputs inputs;
        return inputs;
    }

    std::string LargeFile()
    {
        const std::string path = m_root + "/large.bin";
        if (!fs::exists(path))
            MakeLargeFile(path);
        return path;
    }

    std::string Tree(const TreeSize& size)
    {
        const std::string path = m_root + "/tree" + size.Label();
        if (!fs::exists(path))
            MakeTree(path, size);
        return path;
    }

    std::string WalkDirectory(int entries)
    {
        const std::string path = m_root + "/walk" + std::to_string(entries);
        if (!fs::exists(path))
            MakeWalkDirectory(path, entries);
        return path;
    }

    std::string Scratch(const std::string& name) const { return m_root + "/" + name; }

    ~Inputs()
    {
        std::error_code ignored;
        fs::remove_all(m_root, ignored);
    }

private:
    Inputs()
    {
        std::string pattern = (fs::temp_directory_path() / "tessaline-bench-XXXXXX").string();
        if (mkdtemp(pattern.data()) == nullptr) {
            std::perror("mkdtemp");
            std::exit(1);
        }
        m_root = pattern;
    }

    static void MakeLargeFile(const std::string& path)
    {
        std::ofstream out(path, std::ios::binary);
        std::string block(1 << 20, '\0');
        for (size_t i = 0; i < block.size(); ++i)
            block[i] = static_cast<char>(i * 131 + 7);
        for (size_t written = 0; written < kLargeFileBytes; written += block.size())
            out.write(block.data(), static_cast<std::streamsize>(block.size()));
    }

    static void MakeTree(const std::string& path, const TreeSize& size)
    {
        const std::string content(kTreeFileBytes, 'x');
        for (int d = 0; d < size.directories; ++d) {
            const std::string directory = path + "/dir" + std::to_string(d);
            fs::create_directories(directory);
            for (int f = 0; f < size.files; ++f)
                std::ofstream(directory + "/file" + std::to_string(f) + ".dat") << content;
        }
    }

    static void MakeWalkDirectory(const std::string& path, int entries)
    {
        fs::create_directories(path);
        char name[32];
        for (int i = 0; i < entries; ++i) {
            std::snprintf(name, sizeof name, "/entry%06d.txt", i);
            std::ofstream(path + name);
        }
    }

    std::string m_root;
};

// Runs a tool and waits for it; a failure ends the run, since its figures
// would mean nothing.
void Run(std::vector<std::string> arguments)
{
    std::vector<char*> argv;
    for (std::string& argument : arguments)
        argv.push_back(argument.data());
    argv.push_back(nullptr);
    pid_t child;
    int status = 0;
    if (posix_spawnp(&child, argv[0], nullptr, nullptr, argv.data(), environ) != 0 ||
        waitpid(child, &status, 0) != child || !WIFEXITED(status) || WEXITSTATUS(status) != 0) {
        std::fprintf(stderr, "failed: %s\n", arguments[0].c_str());
        std::exit(1);
    }
}

// Writes back what a round left dirty and lets the file system settle, so
// that the next round does not pay for it.
void Settle()
{
    sync();
    std::this_thread::sleep_for(std::chrono::milliseconds(50));
}

// One 256 MiB file, copied onto an existing target.

template <typename Copy>
void CopyLarge(benchmark::State& state, const char* name, Copy copy)
{
    const std::string source = Inputs::Get().LargeFile();
    const std::string target = Inputs::Get().Scratch(name);
    for (auto _ : state)
        copy(source, target);
    state.SetBytesProcessed(static_cast<int64_t>(state.iterations() * kLargeFileBytes));
    fs::remove(target);
    Settle();
}

// Trees of small files: copy (the removal of the copy not timed), and
// removal (the copy to remove not timed). A tree's dirty pages and journal
// are written back by whatever runs next, so each round starts from a synced
// and settled file system, and is one repetition of its own: the report
// takes the median of the rounds, which bench/run interleaves with the
// peers'. One untimed round first warms each implementation.

constexpr int kTreeRounds = 15;

template <typename CopyTree>
void TreeCopy(benchmark::State& state, const char* name, TreeSize size, CopyTree copy)
{
    const std::string source = Inputs::Get().Tree(size);
    const std::string target = Inputs::Get().Scratch(name);
    if (!fs::exists(target + ".warm")) {
        copy(source, target + ".warm");
    }
    for (auto _ : state) {
        state.PauseTiming();
        fs::remove_all(target);
        Settle();
        state.ResumeTiming();
        copy(source, target);
    }
    state.SetItemsProcessed(state.iterations() * size.directories * size.files);
}

template <typename RemoveTree>
void TreeRemove(benchmark::State& state, const char* name, TreeSize size, RemoveTree remove)
{
    const std::string source = Inputs::Get().Tree(size);
    const std::string target = Inputs::Get().Scratch(name);
    if (!fs::exists(target + ".warm")) {
        fs::copy(source, target + ".warm", fs::copy_options::recursive);
        remove(target + ".warm");
        fs::create_directory(target + ".warm");
    }
    for (auto _ : state) {
        state.PauseTiming();
        fs::copy(source, target, fs::copy_options::recursive);
        Settle();
        state.ResumeTiming();
        remove(target);
    }
    state.SetItemsProcessed(state.iterations() * size.directories * size.files);
}

// One round per repetition, as many repetitions as the tree benchmarks
// need for a stable median.
benchmark::internal::Benchmark* Rounds(benchmark::internal::Benchmark* bench)
{
    return bench->Iterations(1)->Repetitions(kTreeRounds);
}

// A walk by pattern; every implementation counts the matches.

template <typename Walk>
void WalkBench(benchmark::State& state, int entries, Walk walk)
{
    const std::string directory = Inputs::Get().WalkDirectory(entries);
    const int expected = entries / 10;
    for (auto _ : state) {
        const int matches = walk(directory);
        if (matches != expected) {
            state.SkipWithError("wrong number of matches");
            break;
        }
    }
    state.SetItemsProcessed(state.iterations() * entries);
}

int WalkTessaline(const std::string& directory)
{
    const std::string pattern = directory + "/" + kWalkPattern;
    int matches = 0;
    for (rvDirIterator it(pattern.c_str()); it != rvDirIterator(); ++it)
        ++matches;
    return matches;
}

int WalkReaddir(const std::string& directory)
{
    int matches = 0;
    DIR* dir = opendir(directory.c_str());
    while (const dirent* entry = readdir(dir)) {
        if (fnmatch(kWalkPattern, entry->d_name, FNM_PATHNAME) == 0)
            ++matches;
    }
    closedir(dir);
    return matches;
}

int WalkStdFilesystem(const std::string& directory)
{
    int matches = 0;
    for (const fs::directory_entry& entry : fs::directory_iterator(directory)) {
        if (fnmatch(kWalkPattern, entry.path().filename().c_str(), FNM_PATHNAME) == 0)
            ++matches;
    }
    return matches;
}

int WalkGlob(const std::string& directory)
{
    const std::string pattern = directory + "/" + kWalkPattern;
    glob_t found;
    const int matches = glob(pattern.c_str(), GLOB_NOSORT, nullptr, &found) == 0 ? static_cast<int>(found.gl_pathc) : 0;
    globfree(&found);
    return matches;
}

benchmark::internal::Benchmark* WallClock(benchmark::internal::Benchmark* bench)
{
    return bench->UseRealTime()->Unit(benchmark::kMillisecond);
}

void CopyTessaline(const std::string& from, const std::string& to)
{
    benchmark::DoNotOptimize(rvCopyFile(from.c_str(), to.c_str(), 1, 1, 0, 0, nullptr, nullptr, 0644));
}

void CopyStdFilesystem(const std::string& from, const std::string& to)
{
    fs::copy_file(from, to, fs::copy_options::overwrite_existing);
}

void CopyTreeStdFilesystem(const std::string& from, const std::string& to)
{
    fs::copy(from, to, fs::copy_options::recursive);
}

void Cp(const std::string& from, const std::string& to)
{
    Run({"cp", from, to});
}

void CpRecursive(const std::string& from, const std::string& to)
{
    Run({"cp", "-r", from, to});
}

void RemoveTessaline(const std::string& path)
{
    benchmark::DoNotOptimize(rvUnlink(path.c_str(), 1));
}

void RemoveStdFilesystem(const std::string& path)
{
    fs::remove_all(path);
}

void RmRecursive(const std::string& path)
{
    Run({"rm", "-rf", path});
}

using CopyFunction = void (*)(const std::string&, const std::string&);
using RemoveFunction = void (*)(const std::string&);
using WalkFunction = int (*)(const std::string&);

[[maybe_unused]] const bool registered = [] {
    const struct {
        const char* impl;
        CopyFunction copyFile;
        CopyFunction copyTree;
        RemoveFunction removeTree;
    } copiers[] = {
        {"tessaline", CopyTessaline, CopyTessaline, RemoveTessaline},
        {"std_fs", CopyStdFilesystem, CopyTreeStdFilesystem, RemoveStdFilesystem},
        {"cp", Cp, CpRecursive, nullptr},
        {"rm", nullptr, nullptr, RmRecursive},
    };
    for (const TreeSize& size : kTreeSizes) {
        for (const auto& c : copiers) {
            if (c.copyTree != nullptr) {
                const std::string target = std::string("treecopy.") + c.impl;
                Rounds(WallClock(bench::Register("files_tree_copy", c.impl, size.Label(), [=](benchmark::State& state) {
                    TreeCopy(state, target.c_str(), size, c.copyTree);
                })));
            }
        }
    }
    for (const auto& c : copiers) {
        if (c.removeTree != nullptr) {
            const TreeSize size = kTreeSizes[2];
            const std::string target = std::string("treeremove.") + c.impl;
            Rounds(WallClock(bench::Register("files_tree_remove", c.impl, size.Label(), [=](benchmark::State& state) {
                TreeRemove(state, target.c_str(), size, c.removeTree);
            })));
        }
    }
    const struct {
        const char* impl;
        WalkFunction walk;
    } walkers[] = {
        {"tessaline", WalkTessaline},
        {"readdir_fnmatch", WalkReaddir},
        {"std_fs", WalkStdFilesystem},
        {"glob", WalkGlob},
    };
    for (const int entries : kWalkSizes) {
        for (const auto& w : walkers) {
            WallClock(bench::Register("files_walk", w.impl, std::to_string(entries),
                                      [=](benchmark::State& state) { WalkBench(state, entries, w.walk); }));
        }
    }
    for (const auto& c : copiers) {
        if (c.copyFile != nullptr) {
            const std::string target = std::string("large.") + c.impl;
            WallClock(bench::Register("files_copy_large", c.impl, "256MiB",
                                      [=](benchmark::State& state) { CopyLarge(state, target.c_str(), c.copyFile); }));
        }
    }
    return true;
}();

}  // namespace
