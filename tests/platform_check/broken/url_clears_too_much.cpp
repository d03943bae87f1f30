// Clears one byte more than the buffer has.
#include <cstring>

#include "tests/platform_check/broken/standin.h"

int TavoCgiURLEncode(const char *src, char *dst, size_t size) {
    const int result = Broken::Standin(TavoCgiURLEncode, "TavoCgiURLEncode")(src, dst, size);
    if (result == 0) {
        const size_t length = std::strlen(dst);
        std::memset(dst + length, 0, size + 2 - length);
    }
    return result;
}
