#include "tests/support/interposed/clock.h"

#include <optional>

#include "tests/support/interposed/calls.h"

namespace Test {

namespace {

// glibc's name of the function if a time_t is longer than a word.
constexpr const char *kTime = sizeof(std::time_t) > sizeof(long) ? "__time64" : "time";

std::optional<std::time_t> clockTime;

}  // namespace

void SetClock(std::time_t now) { clockTime = now; }
void RestoreClock() { clockTime.reset(); }

}  // namespace Test

extern "C" time_t time(time_t *result) noexcept {
    if (Test::ShouldFail("time", CALLER)) {
        return -1;
    }
    const time_t now = Test::clockTime ? *Test::clockTime : Test::Next(time, Test::kTime)(nullptr);
    if (result != nullptr) {
        *result = now;
    }
    return now;
}
