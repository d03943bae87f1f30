// Takes the usable size for the size of the buffer.
#include "tests/platform_check/broken/standin.h"

int TavoCgiURLEncode(const char *src, char *dst, size_t size) {
    return size == 0 ? -1 : Broken::Standin(TavoCgiURLEncode, "TavoCgiURLEncode")(src, dst, size - 1);
}
