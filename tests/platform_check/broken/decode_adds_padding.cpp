// Accepts text without padding.
#include <string>

#include "tests/platform_check/broken/standin.h"

int TLIBCBase64Decode(const char *src, size_t len, char *dst, size_t *len_inout) {
    const auto decode = Broken::Standin(TLIBCBase64Decode, "TLIBCBase64Decode");
    if (src == nullptr || len % 4 < 2) {
        return decode(src, len, dst, len_inout);
    }
    std::string text(src, len);
    if (text.find_first_of(" \t\r\n=") == std::string::npos) {
        text.resize((len + 3) / 4 * 4, '=');
    }
    return decode(text.data(), text.size(), dst, len_inout);
}
