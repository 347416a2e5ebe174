// The configuration store: loading the generated files, looking every key up
// in another letter case than the file's, and saving after changing 1% of
// the values. The peers run in the same executable (one file each).
#include "config_bench.h"
#include "tessaline/config/rvConfig.h"

using namespace config_bench;

namespace {

void LoadPath(benchmark::State& state, const std::string& path, int keys)
{
    rvConfig config;
    for (auto _ : state) {
        if (config.Load(path.c_str(), rvConfig::OpenRead) == 0) {
            state.SkipWithError("cannot load");
            break;
        }
    }
    state.SetItemsProcessed(state.iterations() * keys);
}

void Load(benchmark::State& state, Size size)
{
    LoadPath(state, DataFile(size), size.Entries());
}

// Names that collide in the name hash against names of the usual layout,
// 40,000 keys each.
void LoadNames(benchmark::State& state, bool colliding)
{
    LoadPath(state, colliding ? CollidingFile() : DataFile(kOrdinaryNames), kOrdinaryNames.Entries());
}

void Lookup(benchmark::State& state, Size size)
{
    rvConfig config(DataFile(size).c_str(), rvConfig::OpenRead);
    if (config.IsValid() == 0) {
        state.SkipWithError("cannot load");
        return;
    }
    const std::vector<Name> names = AllNames(size, true);
    for (auto _ : state) {
        for (const Name& name : names)
            benchmark::DoNotOptimize(config.GetValue(name.key.c_str(), nullptr, name.section.c_str()));
    }
    CountEntries(state, size);
}

void Flush(benchmark::State& state, Size size)
{
    ScratchCopy copy(size);
    rvConfig config(copy.Path().c_str(), rvConfig::OpenUpdate);
    if (config.IsValid() == 0) {
        state.SkipWithError("cannot load");
        return;
    }
    long round = 0;
    for (auto _ : state) {
        for (const auto& [name, value] : Changes(size, round))
            config.PutValue(name.key.c_str(), value.c_str(), name.section.c_str());
        if (config.Flush(0) == 0) {
            state.SkipWithError("flush failed");
            break;
        }
        ++round;
    }
    CountEntries(state, size);
}

// The typed getters over 100 keys of each type, in other letter case; no
// peer has the same conversions.
void TypedGetters(benchmark::State& state)
{
    rvConfig config;
    std::vector<std::string> intKeys, doubleKeys, boolKeys;
    for (int j = 0; j < 100; ++j) {
        const std::string key = "key" + std::to_string(j);
        config.PutValue(("i" + key).c_str(), j * 1000, "numbers");
        config.PutValue(("d" + key).c_str(), j * 0.25, "numbers");
        config.PutBool(("b" + key).c_str(), j % 2, "numbers");
        intKeys.push_back("I" + key);
        doubleKeys.push_back("D" + key);
        boolKeys.push_back("B" + key);
    }
    for (auto _ : state) {
        for (size_t n = 0; n < intKeys.size(); ++n) {
            benchmark::DoNotOptimize(config.GetValue(intKeys[n].c_str(), 0, "NUMBERS"));
            benchmark::DoNotOptimize(config.GetValue(doubleKeys[n].c_str(), 0.0, "NUMBERS"));
            benchmark::DoNotOptimize(config.GetBool(boolKeys[n].c_str(), 0, "NUMBERS"));
        }
    }
    state.SetItemsProcessed(state.iterations() * static_cast<long>(intKeys.size()) * 3);
}

[[maybe_unused]] const bool registered = [] {
    RegisterLoadLookup("tessaline", Load, Lookup);
    RegisterLarge("tessaline", Load, Lookup);
    RegisterFlush("tessaline", Flush);
    bench::Register("config_names", "tessaline", "colliding40000", LoadNames, true)->Unit(benchmark::kMillisecond);
    bench::Register("config_names", "tessaline", "ordinary40000", LoadNames, false)->Unit(benchmark::kMillisecond);
    RegisterResident("tessaline", [](const std::string& path, auto measure) {
        rvConfig config(path.c_str(), rvConfig::OpenRead);
        measure();
    });
    bench::Register("config_typed_get", "tessaline", "300", TypedGetters)->Unit(benchmark::kMicrosecond);
    return true;
}();

}  // namespace
