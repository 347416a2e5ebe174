// The command line of tessaline-config taken apart: the command word, its
// operands in order, and the options, which may stand anywhere after the
// command word ("--" ends them).
#ifndef TESSALINE_TOOLS_ARGUMENTS_H
#define TESSALINE_TOOLS_ARGUMENTS_H

#include <optional>
#include <string>
#include <vector>

namespace tessaline::tools {

struct Arguments {
    std::string command;
    std::vector<std::string> operands;
    std::optional<std::string> defaultText;
    std::string listSeparator = ", ";
    std::string format = "ini";
    bool decrypt = false;
    bool encrypt = false;
    bool existing = false;
    bool backup = false;
    bool list = false;
    bool verbose = false;
};

// The whole interface, as --help prints it.
extern const char kUsageText[];

// Throws Failure(kUsage) for an unknown command or option, an option the
// command does not take, a missing option value, or too few or too many
// operands. "--help" and "--version" come back as the command.
Arguments ParseArguments(int argc, char** argv);

}  // namespace tessaline::tools

#endif
