// The one main of every benchmark executable; the groups register
// themselves from their own files.
#include <benchmark/benchmark.h>

BENCHMARK_MAIN();
