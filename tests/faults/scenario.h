#ifndef TAVOSSO_TESTS_FAULTS_SCENARIO_H
#define TAVOSSO_TESTS_FAULTS_SCENARIO_H

#include <exception>
#include <functional>
#include <iosfwd>
#include <memory>
#include <string>
#include <vector>

#include "tests/loopback/loopback_provider.h"

// Complete uses of the library by a front end: with real servers and files, in a process with other effective ids than
// root's.
namespace Test {

/// A prepared use of the library; only `call` is left.
struct Use {
    std::unique_ptr<Provider> provider;
    std::unique_ptr<Server> plainServer;
    std::function<void(std::string &result)> call;
};

struct Scenario {
    const char *name;
    const char *before;     // result before the call
    const char *mayReturn;  // allowed results if it returns, as a regular expression; null: it must throw
    Use (*prepare)();
};

void PrintTo(const Scenario &scenario, std::ostream *stream);

const std::vector<Scenario> &Scenarios();

/// Logins over HTTP without TLS, including forged tokens.
const std::vector<Scenario> &PlainLogins();

/// The ending, unformatted, because formatting needs memory.
struct Ending {
    std::string result;
    std::exception_ptr failure;
};

void Run(const Use &use, Ending &ending);

/// "returns RESULT" or "throws CLASS: TEXT", with the result if it changed. Random values are shown as NONCE and
/// DIGEST.
std::string Describe(const Scenario &scenario, const Ending &ending);

/// The effective ids in every scenario.
constexpr unsigned int kUser = 1024;
constexpr unsigned int kGroup = 100;

}  // namespace Test

#endif
