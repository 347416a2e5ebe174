// How tessaline-config ends: its exit statuses, and the failure that carries
// a status and its one line of explanation up to main.
#ifndef TESSALINE_TOOLS_FAILURE_H
#define TESSALINE_TOOLS_FAILURE_H

#include <string>

namespace tessaline::tools {

// Scripts test these numbers: they never change meaning.
enum ExitStatus : int {
    kDone = 0,
    kNotFound = 1,
    kUsage = 2,
    kFileError = 3,
};

struct Failure {
    ExitStatus status;
    // What went wrong, without the program's name and the line end.
    std::string message;
};

// strerror(error) as a string.
std::string SystemText(int error);

}  // namespace tessaline::tools

#endif
