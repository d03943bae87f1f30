// Tests the error detection: each seed names an error and the report that must detect it.
#include <functional>
#include <limits>
#include <map>
#include <vector>

#include "tests/fuzz/target.h"

namespace Fuzz {

namespace {

// Volatile prevents the compiler from removing the errors.
volatile int one = 1;
volatile std::size_t size = 8;

void ReadBeyondBuffer() {
    const std::vector<char> buffer(size);
    const volatile char *bytes = buffer.data();
    static_cast<void>(bytes[size]);
}

void Overflow() {
    const int largest = std::numeric_limits<int>::max();
    one = largest + one;
}

void *volatile kept = nullptr;

void Leak() {
    kept = new char[size];
    kept = nullptr;
}

void IndexBeyondEnd() {
    const std::vector<char> buffer(size);
    static_cast<void>(buffer[size]);
}

void ExhaustMemory() { const std::vector<char> buffer(size << 28); }

void ThrowUnknownException() { throw std::exception(); }

}  // namespace

bool Accepts(const std::string &input) {
    const std::map<std::string, std::function<void()>> errors = {
        {"heap-buffer-overflow", ReadBeyondBuffer},
        {"signed-integer-overflow", Overflow},
        {"detected-memory-leaks", Leak},
        {"Assertion", IndexBeyondEnd},
        {"out-of-memory", ExhaustMemory},
        {"terminate-called", ThrowUnknownException},
        {"Violated-property", [] { Require(false, "always false"); }},
    };
    const auto error = errors.find(input);
    if (error != errors.end()) {
        error->second();
    }
    return false;
}

}  // namespace Fuzz
