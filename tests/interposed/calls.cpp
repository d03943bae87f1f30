#include "tests/interposed/calls.h"

#include <openssl/err.h>

#include <map>

namespace Test {

namespace {

std::map<std::string, int> &CallsUntilFailure() {
    static std::map<std::string, int> calls;
    return calls;
}

std::vector<std::string> &Cleansed() {
    static auto &texts = *new std::vector<std::string>();  // outlives libcrypto's own end, which cleanses too
    return texts;
}

}  // namespace

void FailCall(const std::string &function, int n) { CallsUntilFailure()[function] = n; }

void FailNothing() { CallsUntilFailure().clear(); }

bool ShouldFail(const std::string &function) {
    const auto call = CallsUntilFailure().find(function);
    return call != CallsUntilFailure().end() && --call->second == 0;
}

std::vector<std::string> TakeCleansed() {
    std::vector<std::string> taken;
    taken.swap(Cleansed());
    return taken;
}

void NoteCleansed(const void *memory, std::size_t size) {
    if (memory != nullptr) {
        Cleansed().emplace_back(static_cast<const char *>(memory), size);
    }
}

void RaiseCryptoError() { ERR_raise(ERR_LIB_USER, 99); }

}  // namespace Test
