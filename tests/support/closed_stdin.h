// Closes the standard input while an object of this class lives, so that the
// next descriptor opened is 0, as in a host that closed its standard input.
#ifndef TESSALINE_TESTS_SUPPORT_CLOSED_STDIN_H
#define TESSALINE_TESTS_SUPPORT_CLOSED_STDIN_H

#include <unistd.h>

namespace tessaline::test {

class ClosedStdin {
public:
    ClosedStdin() : m_saved(dup(STDIN_FILENO)) { close(STDIN_FILENO); }

    ~ClosedStdin()
    {
        dup2(m_saved, STDIN_FILENO);
        close(m_saved);
    }

    ClosedStdin(const ClosedStdin&) = delete;
    ClosedStdin& operator=(const ClosedStdin&) = delete;

private:
    int m_saved;
};

}  // namespace tessaline::test

#endif
