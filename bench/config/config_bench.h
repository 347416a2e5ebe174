// Shared set-up of the configuration benchmarks: the generated inputs, the
// names to look up, the values to change, and scratch copies to save over.
//
// Groups (see common/bench_names.h), sizes <sections>x<keys>:
//   config_load/<impl>/{10x10,100x100,1000x100}     read a file into memory
//   config_lookup/<impl>/{10x10,100x100,1000x100}   every key once, in other
//       letter case where the implementation is case-insensitive, else exact
//   config_flush/<impl>/1000x100   change 1% of the values, save, fsync
//   config_load and config_lookup at 10000x100 (1M keys), for the peers that
//       take it in reasonable time
//   config_names/tessaline/{colliding40000,ordinary40000}   load 40,000 keys
//       of one section whose names agree in every byte the name hash reads,
//       against the same number of keys in the usual layout (400x100)
//   config_memory/<impl>/1000x100   resident memory that a loaded file adds,
//       measured in a child process (counter resident_bytes)
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
const Size kLargeSize = {10000, 100};
const Size kFlushSize = {1000, 100};
const Size kMemorySize = {1000, 100};

// Writes `text` to `path` unless the file is there already.
inline void WriteOnce(const std::string& path, const std::string& text)
{
    if (access(path.c_str(), F_OK) == 0)
        return;
    const std::string temporary = path + ".part";
    FILE* file = std::fopen(temporary.c_str(), "w");
    if (file == nullptr || std::fwrite(text.data(), 1, text.size(), file) != text.size() || std::fclose(file) != 0 ||
        std::rename(temporary.c_str(), path.c_str()) != 0) {
        std::perror(path.c_str());
        std::exit(1);
    }
}

// The generator's layout: "[Section<i>]", a comment before every 10th key,
// "key<j> = value <i>.<j>", a blank line between sections.
inline std::string GeneratedText(const Size& size)
{
    std::string text;
    for (int i = 0; i < size.sections; ++i) {
        if (i != 0)
            text += "\n";
        text += "[Section" + std::to_string(i) + "]\n";
        for (int j = 0; j < size.keys; ++j) {
            if (j % 10 == 0)
                text += "# comment " + std::to_string(i) + "." + std::to_string(j) + "\n";
            text += "key" + std::to_string(j) + " = value " + std::to_string(i) + "." + std::to_string(j) + "\n";
        }
    }
    return text;
}

// The three usual sizes come from the project's generator; other sizes are
// made here on first use, in the same layout.
inline std::string DataFile(const Size& size)
{
    const std::string path = std::string(TESSALINE_BENCH_DATA) + "/ini_" + size.Label() + ".ini";
    bool generated = false;
    for (const Size& usual : kSizes)
        generated = generated || (usual.sections == size.sections && usual.keys == size.keys);
    if (!generated)
        WriteOnce(path, GeneratedText(size));
    return path;
}

// 40,000 keys of one section, 20 characters each, that all read "x" at the
// five bytes the name hash of rvConfig looks at (1, 3, 8, 14 and 18 from the
// end) and differ in the others.
inline std::string CollidingFile()
{
    const std::string path = std::string(TESSALINE_BENCH_DATA) + "/colliding40000.ini";
    std::string text = "[colliding]\n";
    for (int n = 0; n < 40000; ++n) {
        std::string digits = std::to_string(n);
        digits.insert(0, 15 - digits.size(), '0');
        std::string name(20, 'x');
        for (int i = 0, d = 0; i < 20; ++i) {
            if (i != 2 && i != 6 && i != 12 && i != 17 && i != 19)
                name[i] = digits[d++];
        }
        text += name + " = value " + std::to_string(n) + "\n";
    }
    WriteOnce(path, text);
    return path;
}

const Size kOrdinaryNames = {400, 100};

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

// Load and lookup of 10000x100, for the peers that manage it.
template <typename Load, typename Lookup>
void RegisterLarge(const char* impl, Load load, Lookup lookup)
{
    bench::Register("config_load", impl, kLargeSize.Label(), load, kLargeSize)->Unit(benchmark::kMillisecond);
    bench::Register("config_lookup", impl, kLargeSize.Label(), lookup, kLargeSize)->Unit(benchmark::kMillisecond);
}

inline long ResidentBytes()
{
    long pages = 0, resident = 0;
    FILE* statm = std::fopen("/proc/self/statm", "r");
    if (statm != nullptr) {
        if (std::fscanf(statm, "%ld %ld", &pages, &resident) != 2)
            resident = 0;
        std::fclose(statm);
    }
    return resident * sysconf(_SC_PAGESIZE);
}

// The resident memory that loading the 1000x100 file adds, in a process of
// its own: `load(path, measure)` loads and calls `measure()` while it holds
// the loaded file. Reported as the counter resident_bytes.
template <typename Load>
void RegisterResident(const char* impl, Load load)
{
    const std::string name = bench::Name("config_memory", impl, kMemorySize.Label());
    bench::Probes()[name] = [load](const std::string& path) {
        const long before = ResidentBytes();
        long added = -1;
        load(path, [&] { added = ResidentBytes() - before; });
        return added;
    };
    bench::Register("config_memory", impl, kMemorySize.Label(),
                    [name](benchmark::State& state) {
                        long bytes = -1;
                        for (auto _ : state)
                            bytes = bench::ProbeInFreshProcess(name, DataFile(kMemorySize));
                        if (bytes < 0)
                            state.SkipWithError("the probe gave no measure");
                        state.counters["resident_bytes"] = static_cast<double>(bytes);
                    })
        ->Iterations(1)
        ->Unit(benchmark::kMillisecond);
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
