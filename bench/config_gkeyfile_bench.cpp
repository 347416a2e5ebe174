// GLib's GKeyFile on the same inputs, as a peer for the configuration
// store's figures. GKeyFile compares names by case, so its lookups use the
// file's own spelling.
#include <string>
#include <utility>
#include <vector>

#include <benchmark/benchmark.h>
#include <glib.h>

namespace {

std::string dataFile(long sections, long keys)
{
    return std::string(TESSALINE_BENCH_DATA) + "/ini_" + std::to_string(sections) + "x" + std::to_string(keys) +
           ".ini";
}

void BM_GKeyFile_Load(benchmark::State& state)
{
    const std::string path = dataFile(state.range(0), state.range(1));
    for (auto _ : state) {
        GKeyFile* file = g_key_file_new();
        if (!g_key_file_load_from_file(file, path.c_str(), G_KEY_FILE_NONE, nullptr)) {
            state.SkipWithError("cannot load the generated file");
        }
        g_key_file_free(file);
    }
    state.SetItemsProcessed(state.iterations() * state.range(0) * state.range(1));
}

void BM_GKeyFile_Lookup(benchmark::State& state)
{
    GKeyFile* file = g_key_file_new();
    g_key_file_load_from_file(file, dataFile(state.range(0), state.range(1)).c_str(), G_KEY_FILE_NONE, nullptr);
    std::vector<std::pair<std::string, std::string>> names;
    for (long i = 0; i < state.range(0); ++i) {
        for (long j = 0; j < state.range(1); ++j) {
            names.emplace_back("Section" + std::to_string(i), "key" + std::to_string(j));
        }
    }
    for (auto _ : state) {
        for (const auto& name : names) {
            gchar* value = g_key_file_get_value(file, name.first.c_str(), name.second.c_str(), nullptr);
            benchmark::DoNotOptimize(value);
            g_free(value);
        }
    }
    g_key_file_free(file);
    state.SetItemsProcessed(state.iterations() * static_cast<long>(names.size()));
}

}  // namespace

BENCHMARK(BM_GKeyFile_Load)->Args({10, 10})->Args({100, 100})->Args({1000, 100})->Unit(benchmark::kMillisecond);
BENCHMARK(BM_GKeyFile_Lookup)->Args({10, 10})->Args({100, 100})->Args({1000, 100})->Unit(benchmark::kMillisecond);
