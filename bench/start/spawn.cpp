// Runs programs by turns, so many of one at once, and prints for each program, as JSON, what such a bunch of processes
// took from start to end.
//
//   start_spawn TURNS AT_ONCE PROGRAM...
#include <fcntl.h>
#include <sched.h>
#include <spawn.h>
#include <sys/resource.h>
#include <sys/wait.h>

#include <algorithm>
#include <chrono>
#include <cstddef>
#include <iostream>
#include <random>
#include <stdexcept>
#include <string>
#include <vector>

namespace {

struct Figures {
    std::vector<double> wall;  // microseconds
    std::vector<double> cpu;   // microseconds
    std::vector<double> faults;
};

void Require(bool condition, const char *what) {
    if (!condition) {
        throw std::runtime_error(what);
    }
}

/// What the processes write is lost.
class Output {
  public:
    Output() {
        posix_spawn_file_actions_init(&actions_);
        posix_spawn_file_actions_addopen(&actions_, 1, "/dev/null", O_WRONLY, 0);
    }
    ~Output() { posix_spawn_file_actions_destroy(&actions_); }
    Output(const Output &) = delete;
    Output &operator=(const Output &) = delete;

    const posix_spawn_file_actions_t *actions() const { return &actions_; }

  private:
    posix_spawn_file_actions_t actions_;
};

double Microseconds(const timeval &time) {
    return static_cast<double>(time.tv_sec) * 1e6 + static_cast<double>(time.tv_usec);
}

/// On the processor that it is on: a process that is moved to another finds nothing of its own in that one's caches.
void StayOnProcessor() {
    cpu_set_t processor;
    CPU_ZERO(&processor);
    CPU_SET(static_cast<std::size_t>(sched_getcpu()), &processor);
    Require(sched_setaffinity(0, sizeof processor, &processor) == 0, "sched_setaffinity");
}

void Start(std::string program, const Output &output) {
    char *const arguments[] = {program.data(), nullptr};
    Require(posix_spawn(nullptr, program.c_str(), output.actions(), nullptr, arguments, environ) == 0, "posix_spawn");
}

/// The kernel accounts the sum of both times by its scheduler's clock: only how it is divided is guessed by ticks.
void Run(const std::string &program, int atOnce, const Output &output, Figures &figures) {
    using std::chrono::steady_clock;
    const steady_clock::time_point start = steady_clock::now();
    for (int i = 0; i < atOnce; ++i) {
        Start(program, output);
    }
    double cpu = 0;
    double faults = 0;
    for (int i = 0; i < atOnce; ++i) {
        int status = 0;
        rusage used{};
        Require(wait4(-1, &status, 0, &used) > 0 && status == 0, program.c_str());
        cpu += Microseconds(used.ru_utime) + Microseconds(used.ru_stime);
        faults += static_cast<double>(used.ru_minflt);
    }
    figures.wall.push_back(std::chrono::duration<double, std::micro>(steady_clock::now() - start).count());
    figures.cpu.push_back(cpu);
    figures.faults.push_back(faults);
}

/// The first decile: the machine is then not busy with something else, nor especially lucky.
double Typical(std::vector<double> values) {
    const auto decile = values.begin() + static_cast<std::ptrdiff_t>(values.size() / 10);
    std::nth_element(values.begin(), decile, values.end());
    return *decile;
}

void Print(const std::vector<Figures> &all) {
    const char *separator = "[";
    for (const Figures &figures : all) {
        std::cout << separator << R"({"wall": )" << Typical(figures.wall) << R"(, "cpu": )" << Typical(figures.cpu)
                  << R"(, "faults": )" << Typical(figures.faults) << "}";
        separator = ", ";
    }
    std::cout << "]\n";
}

}  // namespace

int main(int argc, char **argv) {
    Require(argc > 3, "start_spawn TURNS AT_ONCE PROGRAM...");
    const int turns = std::stoi(argv[1]);
    const int atOnce = std::stoi(argv[2]);
    const std::vector<std::string> programs(argv + 3, argv + argc);
    Require(turns > 0 && atOnce > 0, "counts above zero");

    if (atOnce == 1) {
        StayOnProcessor();
    }
    const Output output;
    std::vector<Figures> all(programs.size());
    std::vector<std::size_t> order(programs.size());
    for (std::size_t i = 0; i < order.size(); ++i) {
        order[i] = i;
    }
    // In an order that is always another, so that none always comes behind the same other one.
    std::mt19937 random{std::random_device()()};
    for (int turn = 0; turn < turns; ++turn) {
        std::shuffle(order.begin(), order.end(), random);
        for (const std::size_t i : order) {
            Run(programs[i], atOnce, output, all[i]);
        }
    }
    Print(all);
}
