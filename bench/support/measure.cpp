#include "bench/support/measure.h"

#include <cstdio>

namespace Bench {

int RunBenchmarks(int argc, char **argv) {
    benchmark::Initialize(&argc, argv);
    if (benchmark::ReportUnrecognizedArguments(argc, argv)) {
        return 2;
    }
    if (benchmark::RunSpecifiedBenchmarks() == 0) {
        std::fputs("No benchmark has such a name.\n", stderr);
        return 1;
    }
    return 0;
}

}  // namespace Bench
