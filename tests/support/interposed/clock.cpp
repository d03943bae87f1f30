#include "tests/support/interposed/clock.h"

#include <optional>

#include "tests/support/interposed/calls.h"

namespace Test {

namespace {

std::optional<std::time_t> clockTime;

}  // namespace

void SetClock(std::time_t now) { clockTime = now; }
void RestoreClock() { clockTime.reset(); }

}  // namespace Test

extern "C" time_t time(time_t *result) noexcept {
    if (Test::ShouldFail("time", CALLER)) {
        return -1;
    }
    const time_t now = Test::clockTime ? *Test::clockTime : Test::Next(time, "time")(nullptr);
    if (result != nullptr) {
        *result = now;
    }
    return now;
}
