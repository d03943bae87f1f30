// Crashes in its initialisation.
#include <cstdlib>

#include "platform/platform.h"

namespace {

[[gnu::constructor]] void Initialise() { std::abort(); }

}  // namespace
