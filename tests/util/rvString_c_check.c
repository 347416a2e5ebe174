/* The plain-named helpers are usable from C. */
#include "tessaline/util/rvString.h"
#include "tessaline/util/rvString.h"

int rvStringFromC(void)
{
    char text[] = "Hello";
    char number[16];
    return _stricmp(_strlwr(text), "HELLO") == 0 && rv_itoa(7, number, 10) == number;
}
