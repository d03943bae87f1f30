#include "tests/support/failure.h"

#include <ostream>

namespace Test {

bool operator==(const Failure &a, const Failure &b) { return a.type == b.type && a.text == b.text; }

std::ostream &operator<<(std::ostream &stream, const Failure &failure) {
    return stream << failure.type << " \"" << failure.text << "\"";
}

}  // namespace Test
