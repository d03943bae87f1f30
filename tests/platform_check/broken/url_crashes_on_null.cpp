// Measures the text before it compares the pointer with null.
#include <cstring>

#include "tests/platform_check/broken/standin.h"

int TavoCgiURLEncode(const char *src, char *dst, size_t size) {
    constexpr size_t kLongest = 100000;
    return std::strlen(src) > kLongest ? -1 : Broken::Standin(TavoCgiURLEncode, "TavoCgiURLEncode")(src, dst, size);
}
