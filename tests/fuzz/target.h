#ifndef TAVOSSO_TESTS_FUZZ_TARGET_H
#define TAVOSSO_TESTS_FUZZ_TARGET_H

#include <openssl/err.h>

#include <initializer_list>
#include <string>
#include <vector>

#include "tests/support/failure.h"
#include "tests/support/system_log.h"

// A fuzz target. libFuzzer runs it (fuzzer.cpp); as a test, replay.cpp runs it with its seeds.
namespace Fuzz {

/// Defined by each target. Passes the input to the library and checks the results. Returns whether the input is
/// accepted, as the target defines it.
bool Accepts(const std::string &input);

/// Not derived from std::exception, so no code in between catches it as a library exception.
struct ViolatedProperty {
    std::string property;
};

/// Prints the violated property and throws ViolatedProperty unless `condition` is true. libFuzzer reports the uncaught
/// exception.
void Require(bool condition, const std::string &property);

/// The exception of a call of the library. Requires that the program's entry in OpenSSL's error queue is preserved and
/// is the only one.
template <typename Function>
Test::Failure FailureOf(Function function) {
    ERR_clear_error();
    ERR_raise(ERR_LIB_USER, 99);
    Test::Failure failure = Test::FailureOf(function);
    Require(ERR_GET_LIB(ERR_get_error()) == ERR_LIB_USER && ERR_get_error() == 0, "the error queue has changed");
    return failure;
}

/// Compares a failure with the expected one. A plain std::logic_error has no fixed text.
void RequireSame(const Test::Failure &failure, const Test::Failure &expected);

/// Requires one of the expected failures.
void RequireOneOf(const Test::Failure &failure, const std::vector<Test::Failure> &expected);

/// Compares the log since the last call with the expected lines, in order and at LOG_ERR.
void RequireLog(const std::vector<std::string> &expected);

/// Requires that the log contains none of the secrets. Ignores short ones, which may occur by chance.
void RequireNotIn(const std::vector<Test::LogLine> &log, std::initializer_list<std::string> secrets);

/// The first `count` - 1 lines and the rest of the input. Missing lines are empty.
std::vector<std::string> Lines(const std::string &input, std::size_t count);

}  // namespace Fuzz

#endif
