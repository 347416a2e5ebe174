// The commands of tessaline-config.
#ifndef TESSALINE_TOOLS_COMMANDS_H
#define TESSALINE_TOOLS_COMMANDS_H

#include <string>

#include "arguments.h"

namespace tessaline::tools {

// Runs the command that ParseArguments accepted, appending what it prints
// to `out`; the caller writes `out` only when the command succeeds, so a
// failure prints nothing on stdout. Throws Failure.
void RunCommand(const Arguments& arguments, std::string& out);

}  // namespace tessaline::tools

#endif
