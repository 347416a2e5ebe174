// A host that only sees the installed headers and library.
#include <cstdio>

#include <tessaline/tessaline.h>

int main()
{
    MMutex mutex(MMutex_::MutexRecursive);
    if (mutex.Lock(nullptr) != 0 || mutex.Unlock(nullptr) != 0) {
        return 1;
    }
    std::printf("host ok\n");
    return 0;
}
