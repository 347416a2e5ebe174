// Captures what the library writes to the standard error stream while an
// object of this class lives.
#ifndef TESSALINE_TESTS_SUPPORT_CAPTURE_STDERR_H
#define TESSALINE_TESTS_SUPPORT_CAPTURE_STDERR_H

#include <cstdio>
#include <string>

#include <unistd.h>

namespace tessaline::test {

class CaptureStderr {
public:
    CaptureStderr() : m_file(std::tmpfile()), m_saved(-1)
    {
        std::fflush(stderr);
        m_saved = dup(STDERR_FILENO);
        dup2(fileno(m_file), STDERR_FILENO);
    }

    ~CaptureStderr()
    {
        Restore();
        std::fclose(m_file);
    }

    CaptureStderr(const CaptureStderr&) = delete;
    CaptureStderr& operator=(const CaptureStderr&) = delete;

    // Everything written so far; stops the capture.
    std::string Text()
    {
        Restore();
        std::string text;
        std::rewind(m_file);
        char buffer[4096];
        size_t count;
        while ((count = std::fread(buffer, 1, sizeof buffer, m_file)) > 0) {
            text.append(buffer, count);
        }
        return text;
    }

private:
    void Restore()
    {
        if (m_saved >= 0) {
            std::fflush(stderr);
            dup2(m_saved, STDERR_FILENO);
            close(m_saved);
            m_saved = -1;
        }
    }

    std::FILE* m_file;
    int m_saved;
};

}  // namespace tessaline::test

#endif
