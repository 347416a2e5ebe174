// Configuration store: loading the generated files and looking every key up
// in another letter case than the file's.
#include <string>
#include <utility>
#include <vector>

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

}  // namespace

BENCHMARK(BM_Load)->Args({10, 10})->Args({100, 100})->Args({1000, 100})->Unit(benchmark::kMillisecond);
BENCHMARK(BM_LookupOtherCase)->Args({10, 10})->Args({100, 100})->Args({1000, 100})->Unit(benchmark::kMillisecond);

BENCHMARK_MAIN();
