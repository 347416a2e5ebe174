// One naming rule for every benchmark of the suite, so that the report can
// pair Tessaline with its peers: "<group>/<impl>/<size>", for example
// "config_load/tessaline/1000x100" beside "config_load/gkeyfile/1000x100".
// The implementation of the library itself is always called "tessaline".
#ifndef TESSALINE_BENCH_COMMON_BENCH_NAMES_H
#define TESSALINE_BENCH_COMMON_BENCH_NAMES_H

#include <cstdio>
#include <functional>
#include <map>
#include <string>
#include <utility>

#include <sys/wait.h>
#include <unistd.h>

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

// Measures that need a process of their own (the memory a load adds,
// without the heap that earlier benchmarks left behind): the executable runs
// itself again as "<exe> --probe=<name> <argument>", and the probe's number
// is what that process prints.
inline std::map<std::string, std::function<long(const std::string&)>>& Probes()
{
    static std::map<std::string, std::function<long(const std::string&)>> probes;
    return probes;
}

// In main, before the benchmarks: true when this process was started to run
// a probe, which has then printed its result.
inline bool RunProbe(int argc, char** argv)
{
    const std::string flag = "--probe=";
    if (argc != 3 || std::string(argv[1]).compare(0, flag.size(), flag) != 0)
        return false;
    const auto probe = Probes().find(argv[1] + flag.size());
    std::printf("%ld\n", probe == Probes().end() ? -1L : probe->second(argv[2]));
    return true;
}

// Runs the probe `name` in a fresh process; -1 if it fails.
inline long ProbeInFreshProcess(const std::string& name, const std::string& argument)
{
    const std::string flag = "--probe=" + name;
    const std::string command = "/proc/self/exe";
    int channel[2];
    if (pipe(channel) != 0)
        return -1;
    const pid_t child = fork();
    if (child == 0) {
        dup2(channel[1], STDOUT_FILENO);
        close(channel[0]);
        close(channel[1]);
        execl(command.c_str(), "probe", flag.c_str(), argument.c_str(), static_cast<char*>(nullptr));
        _exit(127);
    }
    close(channel[1]);
    long result = -1;
    FILE* output = child > 0 ? fdopen(channel[0], "r") : nullptr;
    if (output == nullptr || std::fscanf(output, "%ld", &result) != 1)
        result = -1;
    if (output != nullptr)
        std::fclose(output);
    else
        close(channel[0]);
    int status = 0;
    if (child > 0 && (waitpid(child, &status, 0) != child || status != 0))
        result = -1;
    return result;
}

}  // namespace bench

#endif
