#ifndef TAVOSSO_TESTS_FUZZ_TARGET_H
#define TAVOSSO_TESTS_FUZZ_TARGET_H

#include <openssl/err.h>

#include <initializer_list>
#include <string>
#include <vector>

#include "tests/support/failure.h"
#include "tests/support/system_log.h"

// One surface of the library under inputs that nobody thought of. The same target is run by libFuzzer (fuzzer.cpp) and,
// over its seeds alone, by the ordinary tests (replay.cpp).
namespace Fuzz {

/// Each target defines it: shows the input to its surface, and holds what comes of it against what is promised. Whether
/// the input is good: what that means, the target says.
bool Accepts(const std::string &input);

/// Not an exception of the standard library's family, so that nothing in between can take it for one of the library's.
struct BrokenPromise {
    std::string promise;
};

/// Throws BrokenPromise, and says so on standard error: libFuzzer ends the program where it is thrown.
void Require(bool kept, const std::string &promise);

/// What a call into the library throws. The program's own entry in OpenSSL's error queue must be there afterwards, and
/// no other.
template <typename Function>
Test::Failure FailureOf(Function function) {
    ERR_clear_error();
    ERR_raise(ERR_LIB_USER, 99);
    Test::Failure failure = Test::FailureOf(function);
    Require(ERR_GET_LIB(ERR_get_error()) == ERR_LIB_USER && ERR_get_error() == 0,
            "the error queue is the program's own");
    return failure;
}

/// Holds a failure against the one that is told for this case; a plain std::logic_error has no told text.
void RequireSame(const Test::Failure &failure, const Test::Failure &told);

/// Holds a failure against all that are told for this function.
void RequireOneOf(const Test::Failure &failure, const std::vector<Test::Failure> &told);

/// Holds the lines that were logged since the last call against those that are told, at LOG_ERR and in this order.
void RequireLog(const std::vector<std::string> &told);

/// Holds against the log that it shows none of these texts. A text of a few characters stands in any line by chance,
/// and is not looked for.
void RequireNotIn(const std::vector<Test::LogLine> &log, std::initializer_list<std::string> secrets);

/// The first lines of an input, as many as `count` less one, and the rest of it behind them. Missing ones are empty.
std::vector<std::string> Lines(const std::string &input, std::size_t count);

}  // namespace Fuzz

#endif
