#include "tests/unit/calls.h"

#include <map>

namespace Test {

namespace {

std::map<std::string, int> &CallsUntilFailure() {
    static std::map<std::string, int> calls;
    return calls;
}

}  // namespace

void FailCall(const std::string &function, int n) { CallsUntilFailure()[function] = n; }

void FailNothing() { CallsUntilFailure().clear(); }

bool ShouldFail(const std::string &function) {
    const auto call = CallsUntilFailure().find(function);
    return call != CallsUntilFailure().end() && --call->second == 0;
}

}  // namespace Test
