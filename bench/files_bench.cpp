// The file services against the usual tools, in one run: copying one large
// file, copying and removing a tree of many small files, and walking a large
// directory by pattern. Peers: cp, rm -rf and std::filesystem. The tools run
// as child processes, so all figures are wall-clock time.
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <string>

#include <fnmatch.h>

#include <benchmark/benchmark.h>

#include "tessaline/tessaline.h"

namespace fs = std::filesystem;

namespace {

constexpr size_t kLargeFileBytes = size_t{256} << 20;
constexpr int kTreeDirectories = 100;
constexpr int kFilesPerDirectory = 100;
constexpr int kWalkEntries = 100000;
// One name in ten ends in 7 before its extension.
constexpr const char* kWalkPattern = "*7.txt";

// The inputs, made once under the temporary directory and removed at exit.
class Inputs {
public:
    static Inputs& Get()
    {
        static Inputs inputs;
        return inputs;
    }

    std::string Root() const { return m_root; }
    std::string LargeFile() const { return m_root + "/large.bin"; }
    std::string Tree() const { return m_root + "/tree"; }
    std::string WalkDirectory() const { return m_root + "/walk"; }
    std::string Scratch(const char* name) const { return m_root + "/" + name; }

    ~Inputs()
    {
        std::error_code ignored;
        fs::remove_all(m_root, ignored);
    }

private:
    Inputs()
    {
        std::string pattern = (fs::temp_directory_path() / "tessaline-bench-XXXXXX").string();
        m_root = mkdtemp(pattern.data()) != nullptr ? pattern : std::string();
        MakeLargeFile();
        MakeTree();
        MakeWalkDirectory();
    }

    void MakeLargeFile() const
    {
        std::ofstream out(LargeFile(), std::ios::binary);
        std::string block(1 << 20, '\0');
        for (size_t i = 0; i < block.size(); ++i) {
            block[i] = static_cast<char>(i * 131 + 7);
        }
        for (size_t written = 0; written < kLargeFileBytes; written += block.size()) {
            out.write(block.data(), static_cast<std::streamsize>(block.size()));
        }
    }

    void MakeTree() const
    {
        const std::string content(200, 'x');
        for (int d = 0; d < kTreeDirectories; ++d) {
            const std::string directory = Tree() + "/dir" + std::to_string(d);
            fs::create_directories(directory);
            for (int f = 0; f < kFilesPerDirectory; ++f) {
                std::ofstream(directory + "/file" + std::to_string(f) + ".dat") << content;
            }
        }
    }

    void MakeWalkDirectory() const
    {
        fs::create_directories(WalkDirectory());
        char name[32];
        for (int i = 0; i < kWalkEntries; ++i) {
            std::snprintf(name, sizeof name, "/entry%06d.txt", i);
            std::ofstream(WalkDirectory() + name);
        }
    }

    std::string m_root;
};

void Run(const std::string& command)
{
    if (std::system(command.c_str()) != 0) {
        std::fprintf(stderr, "failed: %s\n", command.c_str());
        std::abort();
    }
}

std::string Quoted(const std::string& path)
{
    return "'" + path + "'";
}

void CountBytes(benchmark::State& state, size_t bytes)
{
    state.SetBytesProcessed(static_cast<int64_t>(state.iterations() * bytes));
}

// One 256 MiB file.

void BM_LargeFile_rvCopyFile(benchmark::State& state)
{
    const Inputs& in = Inputs::Get();
    const std::string target = in.Scratch("large.rv");
    for (auto _ : state) {
        benchmark::DoNotOptimize(rvCopyFile(in.LargeFile().c_str(), target.c_str(), 0, 1, 0, 0,
                                            nullptr, nullptr, 0644));
    }
    CountBytes(state, kLargeFileBytes);
    fs::remove(target);
}

void BM_LargeFile_cp(benchmark::State& state)
{
    const Inputs& in = Inputs::Get();
    const std::string target = in.Scratch("large.cp");
    for (auto _ : state) {
        Run("cp " + Quoted(in.LargeFile()) + " " + Quoted(target));
    }
    CountBytes(state, kLargeFileBytes);
    fs::remove(target);
}

void BM_LargeFile_std_filesystem(benchmark::State& state)
{
    const Inputs& in = Inputs::Get();
    const std::string target = in.Scratch("large.fs");
    for (auto _ : state) {
        fs::copy_file(in.LargeFile(), target, fs::copy_options::overwrite_existing);
    }
    CountBytes(state, kLargeFileBytes);
    fs::remove(target);
}

// A tree of 10,000 small files: copy, then removal of the copy.

template <typename CopyTree>
void TreeCopy(benchmark::State& state, const char* name, CopyTree copy)
{
    const Inputs& in = Inputs::Get();
    const std::string target = in.Scratch(name);
    for (auto _ : state) {
        copy(in.Tree(), target);
        state.PauseTiming();
        fs::remove_all(target);
        state.ResumeTiming();
    }
    state.SetItemsProcessed(state.iterations() * kTreeDirectories * kFilesPerDirectory);
}

template <typename RemoveTree>
void TreeRemove(benchmark::State& state, const char* name, RemoveTree remove)
{
    const Inputs& in = Inputs::Get();
    const std::string target = in.Scratch(name);
    for (auto _ : state) {
        state.PauseTiming();
        fs::copy(in.Tree(), target, fs::copy_options::recursive);
        state.ResumeTiming();
        remove(target);
    }
    state.SetItemsProcessed(state.iterations() * kTreeDirectories * kFilesPerDirectory);
}

void BM_TreeCopy_rvCopyFile(benchmark::State& state)
{
    TreeCopy(state, "tree.rv", [](const std::string& from, const std::string& to) {
        benchmark::DoNotOptimize(
            rvCopyFile(from.c_str(), to.c_str(), 1, 1, 0, 0, nullptr, nullptr, 0644));
    });
}

void BM_TreeCopy_cp(benchmark::State& state)
{
    TreeCopy(state, "tree.cp", [](const std::string& from, const std::string& to) {
        Run("cp -r " + Quoted(from) + " " + Quoted(to));
    });
}

void BM_TreeCopy_std_filesystem(benchmark::State& state)
{
    TreeCopy(state, "tree.fs", [](const std::string& from, const std::string& to) {
        fs::copy(from, to, fs::copy_options::recursive);
    });
}

void BM_TreeRemove_rvUnlink(benchmark::State& state)
{
    TreeRemove(state, "remove.rv", [](const std::string& path) {
        benchmark::DoNotOptimize(rvUnlink(path.c_str(), 1));
    });
}

void BM_TreeRemove_rm(benchmark::State& state)
{
    TreeRemove(state, "remove.rm", [](const std::string& path) { Run("rm -rf " + Quoted(path)); });
}

void BM_TreeRemove_std_filesystem(benchmark::State& state)
{
    TreeRemove(state, "remove.fs", [](const std::string& path) { fs::remove_all(path); });
}

// A walk of 100,000 entries by pattern.

void BM_Walk_rvDirIterator(benchmark::State& state)
{
    const std::string pattern = Inputs::Get().WalkDirectory() + "/" + kWalkPattern;
    for (auto _ : state) {
        int matches = 0;
        for (rvDirIterator it(pattern.c_str()); it != rvDirIterator(); ++it) {
            ++matches;
        }
        benchmark::DoNotOptimize(matches);
    }
    state.SetItemsProcessed(state.iterations() * kWalkEntries);
}

void BM_Walk_std_filesystem(benchmark::State& state)
{
    const std::string directory = Inputs::Get().WalkDirectory();
    for (auto _ : state) {
        int matches = 0;
        for (const fs::directory_entry& entry : fs::directory_iterator(directory)) {
            if (fnmatch(kWalkPattern, entry.path().filename().c_str(), FNM_PATHNAME) == 0) {
                ++matches;
            }
        }
        benchmark::DoNotOptimize(matches);
    }
    state.SetItemsProcessed(state.iterations() * kWalkEntries);
}

}  // namespace

BENCHMARK(BM_LargeFile_rvCopyFile)->Unit(benchmark::kMillisecond)->Iterations(5)->UseRealTime();
BENCHMARK(BM_LargeFile_cp)->Unit(benchmark::kMillisecond)->Iterations(5)->UseRealTime();
BENCHMARK(BM_LargeFile_std_filesystem)->Unit(benchmark::kMillisecond)->Iterations(5)->UseRealTime();
BENCHMARK(BM_TreeCopy_rvCopyFile)->Unit(benchmark::kMillisecond)->Iterations(3)->UseRealTime();
BENCHMARK(BM_TreeCopy_cp)->Unit(benchmark::kMillisecond)->Iterations(3)->UseRealTime();
BENCHMARK(BM_TreeCopy_std_filesystem)->Unit(benchmark::kMillisecond)->Iterations(3)->UseRealTime();
BENCHMARK(BM_TreeRemove_rvUnlink)->Unit(benchmark::kMillisecond)->Iterations(3)->UseRealTime();
BENCHMARK(BM_TreeRemove_rm)->Unit(benchmark::kMillisecond)->Iterations(3)->UseRealTime();
BENCHMARK(BM_TreeRemove_std_filesystem)->Unit(benchmark::kMillisecond)->Iterations(3)->UseRealTime();
BENCHMARK(BM_Walk_rvDirIterator)->Unit(benchmark::kMillisecond)->Iterations(5)->UseRealTime();
BENCHMARK(BM_Walk_std_filesystem)->Unit(benchmark::kMillisecond)->Iterations(5)->UseRealTime();

BENCHMARK_MAIN();
