// tessaline-config against crudini, the INI editor administrators use
// today, timed as whole processes started without a shell: each iteration
// starts the program, which reads the file and prints one value (get) or
// rewrites the file with one value changed (set), and waits for it.
//
// Groups (see common/bench_names.h):
//   tool_get/<impl>/<size>   sizes 1x8 (a 10-line file), 10x10, 100x100,
//   tool_set/<impl>/<size>   1000x100 (sections x keys)
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <string>
#include <vector>

#include <fcntl.h>
#include <spawn.h>
#include <sys/wait.h>

#include <benchmark/benchmark.h>

#include "common/bench_names.h"

extern char** environ;

namespace fs = std::filesystem;

namespace {

struct Size {
    int sections;
    int keys;
    std::string Label() const { return std::to_string(sections) + "x" + std::to_string(keys); }
};

const Size kSizes[] = {{1, 8}, {10, 10}, {100, 100}, {1000, 100}};

// Both programs get the same arguments in their own syntax.
struct Program {
    const char* impl;
    std::vector<std::string> get;
    std::vector<std::string> set;
};

// Runs the program with its output thrown away; false when it fails.
bool Run(std::vector<std::string> arguments)
{
    std::vector<char*> argv;
    for (std::string& argument : arguments) {
        argv.push_back(argument.data());
    }
    argv.push_back(nullptr);
    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_addopen(&actions, 1, "/dev/null", O_WRONLY, 0);
    posix_spawn_file_actions_adddup2(&actions, 1, 2);
    pid_t child;
    int status = 0;
    bool started = posix_spawn(&child, argv[0], &actions, nullptr, argv.data(), environ) == 0;
    posix_spawn_file_actions_destroy(&actions);
    return started && waitpid(child, &status, 0) == child && WIFEXITED(status) && WEXITSTATUS(status) == 0;
}

// A copy of the generated input for one benchmark, since set changes it.
std::string Scratch(const std::string& name, const Size& size)
{
    static const std::string root = [] {
        std::string pattern = (fs::temp_directory_path() / "tessaline-bench-tool-XXXXXX").string();
        if (mkdtemp(pattern.data()) == nullptr) {
            std::perror("mkdtemp");
            std::exit(1);
        }
        std::atexit([] {
            std::error_code ignored;
            fs::remove_all(root, ignored);
        });
        return pattern;
    }();
    std::string path = root + "/" + name + "_" + size.Label() + ".ini";
    fs::copy_file(std::string(TESSALINE_BENCH_DATA) + "/ini_" + size.Label() + ".ini", path,
                  fs::copy_options::overwrite_existing);
    return path;
}

// The command line for FILE, with `{file}` and `{value}` filled in.
std::vector<std::string> Fill(std::vector<std::string> pattern, const std::string& file, const std::string& value)
{
    for (std::string& argument : pattern) {
        argument = argument == "{file}" ? file : argument == "{value}" ? value : argument;
    }
    return pattern;
}

void Get(benchmark::State& state, const Program& program, const Size& size)
{
    const std::string file = Scratch(std::string("get_") + program.impl, size);
    for (auto _ : state) {
        if (!Run(Fill(program.get, file, ""))) {
            state.SkipWithError("the program failed");
            break;
        }
    }
}

// Every iteration stores another value, so that both programs really write.
void Set(benchmark::State& state, const Program& program, const Size& size)
{
    const std::string file = Scratch(std::string("set_") + program.impl, size);
    unsigned turn = 0;
    for (auto _ : state) {
        if (!Run(Fill(program.set, file, (++turn & 1) != 0 ? "odd" : "even"))) {
            state.SkipWithError("the program failed");
            break;
        }
    }
}

[[maybe_unused]] const bool registered = [] {
    std::vector<Program> programs = {
        {"tessaline",
         {TESSALINE_CONFIG_PROGRAM, "get", "{file}", "Section0", "key5"},
         {TESSALINE_CONFIG_PROGRAM, "set", "{file}", "Section0", "key5", "{value}"}},
    };
#ifdef TESSALINE_BENCH_CRUDINI
    programs.push_back({"crudini",
                        {TESSALINE_BENCH_CRUDINI, "--get", "{file}", "Section0", "key5"},
                        {TESSALINE_BENCH_CRUDINI, "--set", "{file}", "Section0", "key5", "{value}"}});
#endif
    for (const Size& size : kSizes) {
        for (const Program& program : programs) {
            bench::Register("tool_get", program.impl, size.Label(), Get, program, size)
                ->UseRealTime()
                ->Unit(benchmark::kMillisecond);
            bench::Register("tool_set", program.impl, size.Label(), Set, program, size)
                ->UseRealTime()
                ->Unit(benchmark::kMillisecond);
        }
    }
    return true;
}();

}  // namespace
