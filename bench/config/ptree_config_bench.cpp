// Boost.PropertyTree as a peer, as its case-insensitive iptree, so looked up
// in upper case. write_ini drops comments; the figure is its plain save.
#include <fstream>

#include <boost/property_tree/ini_parser.hpp>
#include <boost/property_tree/ptree.hpp>

#include "config_bench.h"

using namespace config_bench;
namespace pt = boost::property_tree;

namespace {

void Load(benchmark::State& state, Size size)
{
    const std::string path = DataFile(size);
    for (auto _ : state) {
        pt::iptree tree;
        pt::read_ini(path, tree);
        benchmark::DoNotOptimize(tree.size());
    }
    CountEntries(state, size);
}

void Lookup(benchmark::State& state, Size size)
{
    pt::iptree tree;
    pt::read_ini(DataFile(size), tree);
    std::vector<std::string> paths;
    for (const Name& name : AllNames(size, true))
        paths.push_back(name.section + "." + name.key);
    for (auto _ : state) {
        for (const std::string& path : paths)
            benchmark::DoNotOptimize(tree.get<std::string>(path));
    }
    CountEntries(state, size);
}

void Flush(benchmark::State& state, Size size)
{
    ScratchCopy copy(size);
    pt::iptree tree;
    pt::read_ini(copy.Path(), tree);
    long round = 0;
    for (auto _ : state) {
        for (const auto& [name, value] : Changes(size, round))
            tree.put(name.section + "." + name.key, value);
        pt::write_ini(copy.Path(), tree);
        SyncFile(copy.Path());
        ++round;
    }
    CountEntries(state, size);
}

[[maybe_unused]] const bool registered = [] {
    RegisterLoadLookup("ptree", Load, Lookup);
    RegisterFlush("ptree", Flush);
    return true;
}();

}  // namespace
