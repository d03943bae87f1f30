#ifndef TAVOSSO_TESTS_SUPPORT_INTERPOSED_CLOCK_H
#define TAVOSSO_TESTS_SUPPORT_INTERPOSED_CLOCK_H

#include <ctime>

// Defines `time`.
namespace Test {

/// Sets the time until RestoreClock.
void SetClock(std::time_t now);
void RestoreClock();

}  // namespace Test

#endif
