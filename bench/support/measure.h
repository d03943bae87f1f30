#ifndef TAVOSSO_BENCH_SUPPORT_MEASURE_H
#define TAVOSSO_BENCH_SUPPORT_MEASURE_H

#include <benchmark/benchmark.h>

#include <string>
#include <utility>

#include "bench/support/allocations.h"

namespace Bench {

/// Measures a function that tells whether it has done what it should: what fails fast is no figure.
template <typename Function>
void Register(const std::string &name, Function function) {
    benchmark::RegisterBenchmark(name.c_str(), [function = std::move(function)](benchmark::State &state) {
        if (!function()) {  // which is also the call that makes what is made once
            state.SkipWithError("does not do what it should");
            return;
        }
        bool good = true;
        const unsigned long before = AllocationCount();
        for (auto _ : state) {
            good = function() && good;
        }
        const auto allocations = static_cast<double>(AllocationCount() - before);
        state.counters["allocations"] = benchmark::Counter(allocations, benchmark::Counter::kAvgIterations);
        if (!good) {
            state.SkipWithError("does not do what it should every time");
        }
    });
}

/// Runs what has been registered, as the command line says; the exit code is for main.
int RunBenchmarks(int argc, char **argv);

}  // namespace Bench

#endif
