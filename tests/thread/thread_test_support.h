// Helpers shared by the thread tests.
#ifndef TESSALINE_TESTS_THREAD_THREAD_TEST_SUPPORT_H
#define TESSALINE_TESTS_THREAD_THREAD_TEST_SUPPORT_H

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

}  // namespace tessaline::test

#endif
