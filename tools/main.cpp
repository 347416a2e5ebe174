// tessaline-config: reads and changes configuration files, and encrypts and
// decrypts values, exactly as the programs built on the library do.
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <exception>
#include <string>

#include "arguments.h"
#include "commands.h"
#include "failure.h"

namespace tessaline::tools {

std::string SystemText(int error)
{
    return std::strerror(error);
}

namespace {

int Fail(const std::string& message, int status)
{
    std::fprintf(stderr, "tessaline-config: %s\n", message.c_str());
    return status;
}

int Run(int argc, char** argv)
{
    std::string out;
    try {
        Arguments arguments = ParseArguments(argc, argv);
        if (arguments.command == "--help") {
            out = kUsageText;
        } else if (arguments.command == "--version") {
            out = "tessaline-config " TESSALINE_TOOLS_VERSION "\n";
        } else {
            RunCommand(arguments, out);
        }
    } catch (const Failure& failure) {
        return Fail(failure.message, failure.status);
    } catch (const std::exception& error) {
        return Fail(error.what(), kFileError);
    }
    if (std::fwrite(out.data(), 1, out.size(), stdout) != out.size() || std::fflush(stdout) != 0) {
        return Fail("standard output: " + SystemText(errno), kFileError);
    }
    return kDone;
}

}  // namespace

}  // namespace tessaline::tools

int main(int argc, char** argv)
{
    return tessaline::tools::Run(argc, argv);
}
