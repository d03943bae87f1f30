#ifndef TAVOSSO_TESTS_SUPPORT_COMMAND_OUTPUT_H
#define TAVOSSO_TESTS_SUPPORT_COMMAND_OUTPUT_H

#include <sys/wait.h>

#include <cstdio>
#include <stdexcept>
#include <string>

namespace Test {

struct CommandResult {
    int status;  // 128 and the signal's number if a signal ended it
    std::string output;
};

/// Runs a shell command, and reads what it writes to standard output. Throws if it cannot be run.
inline CommandResult RunShell(const std::string &command) {
    FILE *pipe = popen(command.c_str(), "r");
    if (pipe == nullptr) {
        throw std::runtime_error("cannot run " + command);
    }
    std::string output;
    char chunk[4096];
    for (std::size_t size; (size = std::fread(chunk, 1, sizeof chunk, pipe)) > 0;) {
        output.append(chunk, size);
    }
    const int status = pclose(pipe);
    return {WIFSIGNALED(status) ? 128 + WTERMSIG(status) : WEXITSTATUS(status), output};
}

/// Returns what a shell command writes to standard output. Throws if it cannot be run or fails.
inline std::string OutputOf(const std::string &command) {
    const CommandResult result = RunShell(command);
    if (result.status != 0) {
        throw std::runtime_error("failed: " + command);
    }
    return result.output;
}

}  // namespace Test

#endif
