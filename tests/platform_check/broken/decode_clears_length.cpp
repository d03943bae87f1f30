// Sets the length to 0 if it rejects a text.
#include "tests/platform_check/broken/standin.h"

int TLIBCBase64Decode(const char *src, size_t len, char *dst, size_t *len_inout) {
    const int result = Broken::Standin(TLIBCBase64Decode, "TLIBCBase64Decode")(src, len, dst, len_inout);
    if (result == 0 && src != nullptr && len_inout != nullptr) {
        *len_inout = 0;
    }
    return result;
}
