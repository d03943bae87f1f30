#include "bench/comparison.h"

#include <benchmark/benchmark.h>
#include <sys/resource.h>

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstdio>
#include <cstdlib>
#include <map>

namespace Bench {

namespace {

struct Effort {
    int rounds;
    double seconds;  // per task and round
};
constexpr Effort kThorough{61, 0.05};
constexpr Effort kQuick{15, 0.03};

constexpr char kChildren[] = "children";

double Seconds(const timeval &time) {
    return static_cast<double>(time.tv_sec) + static_cast<double>(time.tv_usec) / 1e6;
}

double SecondsOfChildren() {
    rusage used{};
    getrusage(RUSAGE_CHILDREN, &used);
    return Seconds(used.ru_utime) + Seconds(used.ru_stime);
}

void Register(const std::string &name, const Comparison &comparison, const Task &task, double seconds) {
    const auto measure = [&comparison, &task](benchmark::State &state) {
        comparison.prepare();
        bool succeeded = task();  // includes one-time initialisation
        const double before = SecondsOfChildren();
        for (auto _ : state) {
            succeeded = task() && succeeded;
        }
        const double children = SecondsOfChildren() - before;
        state.counters[kChildren] = benchmark::Counter(children, benchmark::Counter::kAvgIterations);
        if (!succeeded) {
            state.SkipWithError("the task failed");
        }
    };
    benchmark::RegisterBenchmark(name.c_str(), measure)->MinTime(seconds)->UseRealTime();
}

std::string OursOf(std::size_t row) { return std::to_string(row) + " ours"; }
std::string OtherOf(std::size_t row) { return std::to_string(row) + " other"; }

/// Collects the microseconds of each task, one value per round.
class Collector : public benchmark::BenchmarkReporter {
  public:
    bool ReportContext(const Context & /*context*/) override { return true; }

    void ReportRuns(const std::vector<Run> &runs) override {
        for (const Run &run : runs) {
            const std::string &name = run.run_name.function_name;
            if (run.error_occurred) {
                std::fprintf(stderr, "Row %s: %s\n", name.c_str(), run.error_message.c_str());
                std::exit(1);
            }
            const double own = run.cpu_accumulated_time / static_cast<double>(run.iterations);
            values_[name].push_back(1e6 * (own + run.counters.at(kChildren)));
        }
    }

    const std::vector<double> &Of(const std::string &name) const { return values_.at(name); }

  private:
    std::map<std::string, std::vector<double>> values_;
};

double Median(std::vector<double> values) {
    const auto middle = values.begin() + static_cast<std::ptrdiff_t>(values.size() / 2);
    std::nth_element(values.begin(), middle, values.end());
    return *middle;
}

/// Compares within each round, because the speed of the machine varies between rounds.
double MedianRatio(const std::vector<double> &ours, const std::vector<double> &other) {
    std::vector<double> ratios(ours.size());
    std::transform(ours.begin(), ours.end(), other.begin(), ratios.begin(), [](double a, double b) { return a / b; });
    return Median(ratios);
}

std::string Format(const char *format, double value) {
    char text[32];
    std::snprintf(text, sizeof text, format, value);
    return text;
}

std::string Microseconds(double value) { return Format(value < 1000 ? "%.4g" : "%.0f", value); }

std::string Limit(double limit, double ratio) {
    if (limit == 0) {
        return "";
    }
    const bool met = std::round(1000 * ratio) <= std::round(1000 * limit);  // as printed
    return Format("%.2f", limit) + (met ? "" : ", missed");
}

void PrintRow(const std::string &measured, const std::string &ours, const std::string &other, const std::string &ratio,
              const std::string &limit) {
    std::printf("| %-44s | %11s | %-44s | %6s | %-12s |\n", measured.c_str(), ours.c_str(), other.c_str(),
                ratio.c_str(), limit.c_str());
}

void PrintTable(const std::vector<Comparison> &comparisons, const Collector &collector) {
    const auto rule = [](int width) { return std::string(static_cast<std::size_t>(width), '-'); };
    PrintRow("measured", "ours, us", "compared with, us", "ratio", "limit");
    PrintRow(rule(44), rule(10) + ":", rule(44), rule(5) + ":", rule(12));
    for (std::size_t row = 0; row < comparisons.size(); ++row) {
        const Comparison &comparison = comparisons[row];
        const std::vector<double> &ours = collector.Of(OursOf(row));
        const std::vector<double> &other = collector.Of(OtherOf(row));
        const double ratio = MedianRatio(ours, other);
        PrintRow(comparison.measured, Microseconds(Median(ours)),
                 comparison.comparedWith + ": " + Microseconds(Median(other)), Format("%.3f", ratio),
                 Limit(comparison.limit, ratio));
    }
}

}  // namespace

int RunComparisons(const std::vector<Comparison> &comparisons, int argc, char **argv) {
    const bool quick = argc == 2 && std::string(argv[1]) == "--quick";
    if (argc > 1 && !quick) {
        std::fprintf(stderr, "Usage: %s [--quick]\n", argv[0]);
        return 2;
    }
    const Effort effort = quick ? kQuick : kThorough;
    for (std::size_t row = 0; row < comparisons.size(); ++row) {
        const Comparison &comparison = comparisons[row];
        Register(OursOf(row), comparison, comparison.ours, effort.seconds);
        Register(OtherOf(row), comparison, comparison.other, effort.seconds);
    }
    Collector collector;
    for (int round = 0; round < effort.rounds; ++round) {
        benchmark::RunSpecifiedBenchmarks(&collector);
    }
    PrintTable(comparisons, collector);
    return 0;
}

}  // namespace Bench
