// inih's INIReader as a peer: it lower-cases names, so it is looked up in
// upper case. It cannot write, so it has no flush figure.
#include <INIReader.h>

#include "config_bench.h"

using namespace config_bench;

namespace {

void Load(benchmark::State& state, Size size)
{
    const std::string path = DataFile(size);
    for (auto _ : state) {
        INIReader reader(path);
        if (reader.ParseError() != 0) {
            state.SkipWithError("cannot load");
            break;
        }
    }
    CountEntries(state, size);
}

void Lookup(benchmark::State& state, Size size)
{
    INIReader reader(DataFile(size));
    const std::vector<Name> names = AllNames(size, true);
    for (auto _ : state) {
        for (const Name& name : names)
            benchmark::DoNotOptimize(reader.Get(name.section, name.key, ""));
    }
    CountEntries(state, size);
}

[[maybe_unused]] const bool registered = [] {
    RegisterLoadLookup("inih", Load, Lookup);
    return true;
}();

}  // namespace
