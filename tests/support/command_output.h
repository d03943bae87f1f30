#ifndef TAVOSSO_TESTS_SUPPORT_COMMAND_OUTPUT_H
#define TAVOSSO_TESTS_SUPPORT_COMMAND_OUTPUT_H

#include <cstdio>
#include <stdexcept>
#include <string>

namespace Test {

/// Runs a shell command and returns what it writes to standard output. Throws if it cannot be run or fails.
inline std::string OutputOf(const std::string &command) {
    FILE *pipe = popen(command.c_str(), "r");
    if (pipe == nullptr) {
        throw std::runtime_error("cannot run " + command);
    }
    std::string output;
    char chunk[4096];
    for (std::size_t size; (size = std::fread(chunk, 1, sizeof chunk, pipe)) > 0;) {
        output.append(chunk, size);
    }
    if (pclose(pipe) != 0) {
        throw std::runtime_error("failed: " + command);
    }
    return output;
}

}  // namespace Test

#endif
