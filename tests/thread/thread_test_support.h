// Helpers shared by the thread tests.
#ifndef TESSALINE_TESTS_THREAD_THREAD_TEST_SUPPORT_H
#define TESSALINE_TESTS_THREAD_THREAD_TEST_SUPPORT_H

#include <cstdio>
#include <cstring>
#include <string>
#include <thread>

#include <pthread.h>

namespace tessaline::test {

// Runs `body` on a second thread and returns what it returned.
template <typename Body>
auto OnOtherThread(Body body)
{
    decltype(body()) result{};
    std::thread([&] { result = body(); }).join();
    return result;
}

// The line CHECK_SYSERROR writes for `code` on the calling thread.
inline std::string Line(int code)
{
    char line[256];
    std::snprintf(line, sizeof line, "Thread #%d error: %s (%d)\n", static_cast<int>(pthread_self()),
                  std::strerror(code), code);
    return line;
}

}  // namespace tessaline::test

#endif
