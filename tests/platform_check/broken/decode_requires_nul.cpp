// Reads the byte behind the text.
#include "tests/platform_check/broken/standin.h"

int TLIBCBase64Decode(const char *src, size_t len, char *dst, size_t *len_inout) {
    if (src != nullptr) {
        [[maybe_unused]] const volatile char end = src[len];
    }
    return Broken::Standin(TLIBCBase64Decode, "TLIBCBase64Decode")(src, len, dst, len_inout);
}
