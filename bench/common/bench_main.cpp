// The one main of every benchmark executable; the groups register
// themselves from their own files.
#include <benchmark/benchmark.h>

#include "common/bench_names.h"

int main(int argc, char** argv)
{
    if (bench::RunProbe(argc, argv))
        return 0;
    benchmark::Initialize(&argc, argv);
    if (benchmark::ReportUnrecognizedArguments(argc, argv))
        return 1;
    benchmark::RunSpecifiedBenchmarks();
    benchmark::Shutdown();
    return 0;
}
