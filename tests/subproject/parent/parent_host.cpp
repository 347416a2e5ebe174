// Uses the library and carries a warning the parent tolerates.
#include <cstdio>

#include <tessaline/tessaline.h>

int main()
{
    int unused = 0;
    char out[16];
    std::puts(rv_itoa(42, out, 10));
    return 0;
}
