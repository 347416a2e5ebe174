// Helpers shared by the thread tests.
#ifndef TESSALINE_TESTS_THREAD_THREAD_TEST_SUPPORT_H
#define TESSALINE_TESTS_THREAD_THREAD_TEST_SUPPORT_H

#include <chrono>
#include <thread>

namespace tessaline::test {

// Runs `body` on a second thread and returns what it returned.
template <typename Body>
auto OnOtherThread(Body body)
{
    decltype(body()) result{};
    std::thread([&] { result = body(); }).join();
    return result;
}

// Wall time that `body` takes, in seconds.
template <typename Body>
double SecondsFor(Body body)
{
    const auto start = std::chrono::steady_clock::now();
    body();
    return std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();
}

}  // namespace tessaline::test

#endif
