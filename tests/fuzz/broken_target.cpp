// No target but a proof: each of its seeds is a mistake that has to be caught, and names what it is caught as.
#include <functional>
#include <limits>
#include <map>
#include <vector>

#include "tests/fuzz/target.h"

namespace Fuzz {

namespace {

// Volatile, so that the compiler neither sees the mistakes nor does without them.
volatile int one = 1;
volatile std::size_t size = 8;

void ReadBehindTheBuffer() {
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

void IndexBehindTheEnd() {
    const std::vector<char> buffer(size);
    static_cast<void>(buffer[size]);
}

void TakeAllMemory() { const std::vector<char> buffer(size << 28); }

void LetAnUnknownExceptionOut() { throw std::exception(); }

}  // namespace

bool Accepts(const std::string &input) {
    const std::map<std::string, std::function<void()>> mistakes = {
        {"heap-buffer-overflow", ReadBehindTheBuffer},
        {"signed-integer-overflow", Overflow},
        {"detected-memory-leaks", Leak},
        {"Assertion", IndexBehindTheEnd},
        {"out-of-memory", TakeAllMemory},
        {"terminate-called", LetAnUnknownExceptionOut},
        {"Broken-promise", [] { Require(false, "nothing is ever false"); }},
    };
    const auto mistake = mistakes.find(input);
    if (mistake != mistakes.end()) {
        mistake->second();
    }
    return false;
}

}  // namespace Fuzz
