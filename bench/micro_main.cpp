// The entry of the micro-benchmarks. The locale is that of a session, as the launcher sets it.
#include <benchmark/benchmark.h>
#include <clocale>
#include <cstdio>

int main(int argc, char** argv)
{
    if (setlocale(LC_CTYPE, "C.UTF-8") == nullptr) {
        fputs("there is no locale C.UTF-8\n", stderr);
        return 1;
    }
    benchmark::Initialize(&argc, argv);
    if (benchmark::ReportUnrecognizedArguments(argc, argv))
        return 1;
    benchmark::RunSpecifiedBenchmarks();
    return 0;
}
