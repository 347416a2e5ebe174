// A tour of Tessaline: each stop shows what one subsystem offers a host.
#include <cstdio>

#include "tour.h"

int main()
{
    std::printf("Tessaline tour\n");
    TourUtil();
    TourConfig();
    TourFiles();
    TourCrypt();
    TourThread();
    TourTree();
    return 0;
}
