// Compares the run time of an empty program with and without the library.
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include "bench/comparison.h"

namespace {

Bench::Task Run(const char *program) {
    return [program] {
        std::string name = program;
        char *const arguments[] = {name.data(), nullptr};
        pid_t process = 0;
        int status = 0;
        return posix_spawn(&process, program, nullptr, nullptr, arguments, environ) == 0 &&
               waitpid(process, &status, 0) == process && status == 0;
    };
}

}  // namespace

int main(int argc, char **argv) {
    const Bench::Task ours = Run(LOADS_LIBRARY);
    return Bench::RunComparisons(
        {
            {"process that loads the library", ours, "its dependencies", Run(LOADS_DEPENDENCIES), 1.03},
            {"process that loads the library", ours, "the C library", Run(LOADS_NOTHING)},
        },
        argc, argv);
}
