#include <cstdio>

#include "tessaline/tessaline.h"
#include "tour.h"

void TourThread()
{
    std::printf("\n== Threads ==\n");
    MMutex mutex(MMutex_::MutexRecursive);
    int first = mutex.Lock(nullptr);
    int second = mutex.Lock(nullptr);
    std::printf("recursive mutex locked twice: %d %d (holder count %d)\n", first, second, mutex.m_count);
    first = mutex.Unlock(nullptr);
    second = mutex.Unlock(nullptr);
    int third = mutex.Unlock(nullptr);
    std::printf("unlocked twice: %d %d; a third Unlock is refused with %d\n", first, second, third);
}
