// Shared set-up of the configuration benchmarks: the generated inputs, the
// names to look up, the values to change, and scratch copies to save over.
//
// Groups (see common/bench_names.h), sizes <sections>x<keys>:
//   config_load/<impl>/{10x10,100x100,1000x100}     read a file into memory
//   config_lookup/<impl>/{10x10,100x100,1000x100}   every key once, in other
//       letter case where the implementation is case-insensitive, else exact
//   config_flush/<impl>/1000x100   change 1% of the values, save, fsync
#ifndef TESSALINE_BENCH_CONFIG_CONFIG_BENCH_H
#define TESSALINE_BENCH_CONFIG_CONFIG_BENCH_H

#include <cctype>
#include <cstdio>
#include <cstdlib>
#include <string>
#include <utility>
#include <vector>

#include <fcntl.h>
#include <unistd.h>

#include <benchmark/benchmark.h>

#include "common/bench_names.h"

namespace config_bench {

struct Size {
    int sections;
    int keys;
    std::string Label() const { return std::to_string(sections) + "x" + std::to_string(keys); }
    int Entries() const { return sections * keys; }
};

const Size kSizes[] = {{10, 10}, {100, 100}, {1000, 100}};
const Size kFlushSize = {1000, 100};

inline std::string DataFile(const Size& size)
{
    return std::string(TESSALINE_BENCH_DATA) + "/ini_" + size.Label() + ".ini";
}

struct Name {
    std::string section;
    std::string key;
};

// Every section and key of a generated file, in the file's own letter case
// ("Section7", "key3") or in upper case ("SECTION7", "KEY3").
inline std::vector<Name> AllNames(const Size& size, bool upperCase)
{
    std::vector<Name> names;
    for (int i = 0; i < size.sections; ++i) {
        for (int j = 0; j < size.keys; ++j) {
            Name name{"Section" + std::to_string(i), "key" + std::to_string(j)};
            if (upperCase) {
                for (char& c : name.section)
                    c = static_cast<char>(std::toupper(static_cast<unsigned char>(c)));
                for (char& c : name.key)
                    c = static_cast<char>(std::toupper(static_cast<unsigned char>(c)));
            }
            names.push_back(name);
        }
    }
    return names;
}

// The 1% of the entries that a flush round changes, spread over the file;
// `round` shifts the choice and makes the new value.
inline std::vector<std::pair<Name, std::string>> Changes(const Size& size, long round)
{
    std::vector<std::pair<Name, std::string>> changes;
    const int count = size.Entries() / 100;
    for (int n = 0; n < count; ++n) {
        const int i = (n * 7919) % size.sections;
        const int j = static_cast<int>((n * 104729L + round) % size.keys);
        changes.push_back(
            {Name{"Section" + std::to_string(i), "key" + std::to_string(j)}, "changed " + std::to_string(round)});
    }
    return changes;
}

// Forces a saved file to the disk, for the peers that save without it.
inline void SyncFile(const std::string& path)
{
    const int fd = open(path.c_str(), O_RDONLY | O_CLOEXEC);
    if (fd >= 0) {
        fsync(fd);
        close(fd);
    }
}

// A copy of a generated file in a scratch directory, removed with the
// directory afterwards.
class ScratchCopy {
public:
    explicit ScratchCopy(const Size& size) : m_directory("/tmp/tessaline-bench-XXXXXX")
    {
        if (mkdtemp(&m_directory[0]) == nullptr) {
            std::perror("mkdtemp");
            std::exit(1);
        }
        m_path = m_directory + "/config.ini";
        const std::string command = "cp '" + DataFile(size) + "' '" + m_path + "'";
        if (std::system(command.c_str()) != 0) {
            std::fprintf(stderr, "cannot copy %s\n", DataFile(size).c_str());
            std::exit(1);
        }
    }

    ~ScratchCopy()
    {
        const std::string command = "rm -rf '" + m_directory + "'";
        if (std::system(command.c_str()) != 0)
            std::fprintf(stderr, "cannot remove %s\n", m_directory.c_str());
    }

    ScratchCopy(const ScratchCopy&) = delete;
    ScratchCopy& operator=(const ScratchCopy&) = delete;

    const std::string& Path() const { return m_path; }

private:
    std::string m_directory;
    std::string m_path;
};

// Registers load and lookup at the three sizes for one implementation;
// `load` and `lookup` take (state, size).
template <typename Load, typename Lookup>
void RegisterLoadLookup(const char* impl, Load load, Lookup lookup)
{
    for (const Size& size : kSizes) {
        bench::Register("config_load", impl, size.Label(), load, size)->Unit(benchmark::kMillisecond);
        bench::Register("config_lookup", impl, size.Label(), lookup, size)->Unit(benchmark::kMicrosecond);
    }
}

template <typename Flush>
void RegisterFlush(const char* impl, Flush flush)
{
    // Wall-clock time: the wait for the disk is part of a save.
    bench::Register("config_flush", impl, kFlushSize.Label(), flush, kFlushSize)
        ->UseRealTime()
        ->Unit(benchmark::kMillisecond);
}

inline void CountEntries(benchmark::State& state, const Size& size)
{
    state.SetItemsProcessed(state.iterations() * size.Entries());
}

}  // namespace config_bench

#endif
