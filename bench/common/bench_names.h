// One naming rule for every benchmark of the suite, so that the report can
// pair Tessaline with its peers: "<group>/<impl>/<size>", for example
// "config_load/tessaline/1000x100" beside "config_load/gkeyfile/1000x100".
// The implementation of the library itself is always called "tessaline".
#ifndef TESSALINE_BENCH_COMMON_BENCH_NAMES_H
#define TESSALINE_BENCH_COMMON_BENCH_NAMES_H

#include <string>
#include <utility>

#include <benchmark/benchmark.h>

namespace bench {

inline std::string Name(const std::string& group, const std::string& impl, const std::string& size)
{
    return group + "/" + impl + "/" + size;
}

// Registers `function(state, extra...)` under the suite's name.
template <typename Function, typename... Extra>
benchmark::internal::Benchmark* Register(const std::string& group, const std::string& impl, const std::string& size,
                                         Function function, Extra... extra)
{
    return benchmark::RegisterBenchmark(Name(group, impl, size).c_str(),
                                        [=](benchmark::State& state) { function(state, extra...); });
}

}  // namespace bench

#endif
