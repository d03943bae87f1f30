#ifndef TAVOSSO_BENCH_COMPARISON_H
#define TAVOSSO_BENCH_COMPARISON_H

#include <functional>
#include <string>
#include <vector>

namespace Bench {

/// Runs the measured code once and returns whether it succeeded.
using Task = std::function<bool()>;

/// A row of the table.
struct Comparison {
    std::string measured;
    Task ours;
    std::string comparedWith;
    Task other;
    double limit = 0;                       // for the ratio of ours to other; 0: none
    std::function<void()> prepare = [] {};  // runs before either task is measured
};

/// Measures the CPU time of each task, in this thread and in child processes, and prints the table. The only argument
/// is
/// --quick. Returns the exit code for main.
int RunComparisons(const std::vector<Comparison> &comparisons, int argc, char **argv);

}  // namespace Bench

#endif
