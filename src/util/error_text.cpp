#include "util/error_text.h"

#include <cstring>

namespace tessaline::util {

const char* ErrorText(int code)
{
    thread_local char unknown[64];
    // The GNU strerror_r: a static text for a known code, else the buffer.
    return strerror_r(code, unknown, sizeof unknown);
}

}  // namespace tessaline::util
