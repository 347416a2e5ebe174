// SimpleIni as a peer: case-insensitive, so looked up in upper case.
// Debian builds the library with ICU as its converter.
#define SI_CONVERT_ICU
#include <SimpleIni.h>

#include "config_bench.h"

using namespace config_bench;

namespace {

void Load(benchmark::State& state, Size size)
{
    const std::string path = DataFile(size);
    for (auto _ : state) {
        CSimpleIniA ini;
        if (ini.LoadFile(path.c_str()) != SI_OK) {
            state.SkipWithError("cannot load");
            break;
        }
    }
    CountEntries(state, size);
}

void Lookup(benchmark::State& state, Size size)
{
    CSimpleIniA ini;
    ini.LoadFile(DataFile(size).c_str());
    const std::vector<Name> names = AllNames(size, true);
    for (auto _ : state) {
        for (const Name& name : names)
            benchmark::DoNotOptimize(ini.GetValue(name.section.c_str(), name.key.c_str(), nullptr));
    }
    CountEntries(state, size);
}

void Flush(benchmark::State& state, Size size)
{
    ScratchCopy copy(size);
    CSimpleIniA ini;
    ini.LoadFile(copy.Path().c_str());
    long round = 0;
    for (auto _ : state) {
        for (const auto& [name, value] : Changes(size, round))
            ini.SetValue(name.section.c_str(), name.key.c_str(), value.c_str());
        if (ini.SaveFile(copy.Path().c_str()) != SI_OK) {
            state.SkipWithError("cannot save");
            break;
        }
        SyncFile(copy.Path());
        ++round;
    }
    CountEntries(state, size);
}

[[maybe_unused]] const bool registered = [] {
    RegisterLoadLookup("simpleini", Load, Lookup);
    RegisterFlush("simpleini", Flush);
    RegisterResident("simpleini", [](const std::string& path, auto measure) {
        CSimpleIniA ini;
        ini.LoadFile(path.c_str());
        measure();
    });
    return true;
}();

}  // namespace
