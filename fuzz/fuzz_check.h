// A check that stays on in every build: the fuzzer reports the abort as a
// crash and keeps the input that caused it.
#ifndef TESSALINE_FUZZ_FUZZ_CHECK_H
#define TESSALINE_FUZZ_FUZZ_CHECK_H

#include <stdio.h>
#include <stdlib.h>

#define FUZZ_CHECK(condition)                                                              \
    do {                                                                                   \
        if (!(condition)) {                                                                \
            fprintf(stderr, "%s:%d: check failed: %s\n", __FILE__, __LINE__, #condition); \
            abort();                                                                       \
        }                                                                                  \
    } while (0)

#endif
