// Configuration store: loading the generated files and looking every key up
// in another letter case than the file's.
#include <cstdio>
#include <cstdlib>
#include <string>
#include <utility>
#include <vector>

#include <unistd.h>

#include <benchmark/benchmark.h>

#include "tessaline/config/rvConfig.h"

namespace {

struct Size {
    int sections;
    int keys;
};

std::string dataFile(const Size& size)
{
    return std::string(TESSALINE_BENCH_DATA) + "/ini_" + std::to_string(size.sections) + "x" +
           std::to_string(size.keys) + ".ini";
}

Size sizeOf(const benchmark::State& state)
{
    return Size{static_cast<int>(state.range(0)), static_cast<int>(state.range(1))};
}

void BM_Load(benchmark::State& state)
{
    const Size size = sizeOf(state);
    const std::string path = dataFile(size);
    rvConfig config;
    for (auto _ : state) {
        if (config.Load(path.c_str(), rvConfig::OpenRead) == 0) {
            state.SkipWithError("cannot open the generated file");
            break;
        }
    }
    state.SetItemsProcessed(state.iterations() * size.sections * size.keys);
}

void BM_LookupOtherCase(benchmark::State& state)
{
    const Size size = sizeOf(state);
    rvConfig config(dataFile(size).c_str(), rvConfig::OpenRead);
    if (config.IsValid() == 0) {
        state.SkipWithError("cannot open the generated file");
        return;
    }
    std::vector<std::pair<std::string, std::string>> names;
    for (int i = 0; i < size.sections; ++i) {
        for (int j = 0; j < size.keys; ++j) {
            names.emplace_back("SECTION" + std::to_string(i), "KEY" + std::to_string(j));
        }
    }
    for (auto _ : state) {
        for (const auto& name : names) {
            benchmark::DoNotOptimize(config.GetValue(name.second.c_str(), nullptr, name.first.c_str()));
        }
    }
    state.SetItemsProcessed(state.iterations() * static_cast<long>(names.size()));
}

// A copy of a generated file in a scratch directory, removed afterwards.
class ScratchCopy {
public:
    explicit ScratchCopy(const std::string& source) : m_directory("/tmp/tessaline-bench-XXXXXX")
    {
        if (mkdtemp(&m_directory[0]) == nullptr) {
            return;
        }
        m_path = m_directory + "/config.ini";
        FILE* in = std::fopen(source.c_str(), "r");
        FILE* out = std::fopen(m_path.c_str(), "w");
        char buffer[65536];
        size_t count;
        while (in != nullptr && out != nullptr && (count = std::fread(buffer, 1, sizeof buffer, in)) > 0) {
            std::fwrite(buffer, 1, count, out);
        }
        if (in != nullptr) {
            std::fclose(in);
        }
        if (out != nullptr) {
            std::fclose(out);
        }
    }

    ~ScratchCopy()
    {
        unlink(m_path.c_str());
        unlink((m_directory + "/config.new").c_str());
        rmdir(m_directory.c_str());
    }

    const std::string& Path() const { return m_path; }

private:
    std::string m_directory;
    std::string m_path;
};

// Changes 1% of the values, then saves.
void BM_FlushOnePercent(benchmark::State& state)
{
    const Size size = sizeOf(state);
    ScratchCopy copy(dataFile(size));
    rvConfig config(copy.Path().c_str(), rvConfig::OpenUpdate);
    if (config.IsValid() == 0) {
        state.SkipWithError("cannot open the copied file");
        return;
    }
    const int changes = size.sections * size.keys / 100;
    long round = 0;
    for (auto _ : state) {
        for (int n = 0; n < changes; ++n) {
            const int i = (n * 7919) % size.sections;
            const int j = (n * 104729 + static_cast<int>(round)) % size.keys;
            config.PutValue(("key" + std::to_string(j)).c_str(), static_cast<int>(round),
                            ("Section" + std::to_string(i)).c_str());
        }
        if (config.Flush(0) == 0) {
            state.SkipWithError("flush failed");
            break;
        }
        ++round;
    }
    state.SetItemsProcessed(state.iterations() * size.sections * size.keys);
}

void BM_TypedGetters(benchmark::State& state)
{
    rvConfig config;
    std::vector<std::string> keys;
    for (int j = 0; j < 100; ++j) {
        keys.push_back("key" + std::to_string(j));
        config.PutValue(("i" + keys.back()).c_str(), j * 1000, "numbers");
        config.PutValue(("d" + keys.back()).c_str(), j * 0.25, "numbers");
        config.PutBool(("b" + keys.back()).c_str(), j % 2, "numbers");
    }
    std::vector<std::string> intKeys, doubleKeys, boolKeys;
    for (const std::string& key : keys) {
        intKeys.push_back("I" + key);
        doubleKeys.push_back("D" + key);
        boolKeys.push_back("B" + key);
    }
    for (auto _ : state) {
        for (size_t n = 0; n < keys.size(); ++n) {
            benchmark::DoNotOptimize(config.GetValue(intKeys[n].c_str(), 0, "NUMBERS"));
            benchmark::DoNotOptimize(config.GetValue(doubleKeys[n].c_str(), 0.0, "NUMBERS"));
            benchmark::DoNotOptimize(config.GetBool(boolKeys[n].c_str(), 0, "NUMBERS"));
        }
    }
    state.SetItemsProcessed(state.iterations() * static_cast<long>(keys.size()) * 3);
}

}  // namespace

BENCHMARK(BM_Load)->Args({10, 10})->Args({100, 100})->Args({1000, 100})->Unit(benchmark::kMillisecond);
BENCHMARK(BM_LookupOtherCase)->Args({10, 10})->Args({100, 100})->Args({1000, 100})->Unit(benchmark::kMillisecond);
BENCHMARK(BM_FlushOnePercent)->Args({100, 100})->Args({1000, 100})->Unit(benchmark::kMillisecond);
BENCHMARK(BM_TypedGetters)->Unit(benchmark::kMicrosecond);

BENCHMARK_MAIN();
