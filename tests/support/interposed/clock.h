#ifndef TAVOSSO_TESTS_SUPPORT_INTERPOSED_CLOCK_H
#define TAVOSSO_TESTS_SUPPORT_INTERPOSED_CLOCK_H

#include <ctime>

// The program that links this defines `time` itself.
namespace Test {

/// From now on it is this second, until RestoreClock.
void SetClock(std::time_t now);
void RestoreClock();

}  // namespace Test

#endif
