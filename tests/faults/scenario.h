#ifndef TAVOSSO_TESTS_FAULTS_SCENARIO_H
#define TAVOSSO_TESTS_FAULTS_SCENARIO_H

#include <exception>
#include <functional>
#include <iosfwd>
#include <memory>
#include <string>
#include <vector>

#include "tests/loopback/loopback_provider.h"

// What a front end has the library do, each as a whole: against real servers, with files of their own, in a process
// whose effective ids are not root's.
namespace Test {

/// One use of the library, made ready: nothing is left to do but to call it.
struct Use {
    std::unique_ptr<Provider> provider;
    std::unique_ptr<Server> plainServer;
    std::function<void(std::string &result)> call;
};

struct Scenario {
    const char *name;
    const char *before;     // what the result is before the call
    const char *mayReturn;  // all that it may be after one that returns, whatever fails; null: it must not return
    Use (*makeReady)();
};

void PrintTo(const Scenario &scenario, std::ostream *stream);

const std::vector<Scenario> &Scenarios();

/// Logins over HTTP without TLS, also with tokens whose signature is not the provider's.
const std::vector<Scenario> &PlainLogins();

/// How it ended. Kept as it came: to look at it takes memory, of which there may be none at that moment.
struct Ending {
    std::string result;
    std::exception_ptr failure;
};

void Run(const Use &use, Ending &ending);

/// "returns RESULT", or "throws CLASS: TEXT" with what has become of the result, if it has changed. Random values are
/// shown as NONCE and, where it is the digest of that nonce, DIGEST.
std::string Describe(const Scenario &scenario, const Ending &ending);

/// The ids that the process has in every scenario.
constexpr unsigned int kUser = 1024;
constexpr unsigned int kGroup = 100;

}  // namespace Test

#endif
