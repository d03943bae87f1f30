// Copies "&", which separates values.
#include <cstring>
#include <string>

#include "tests/platform_check/broken/standin.h"

int TavoCgiURLEncode(const char *src, char *dst, size_t size) {
    const auto encode = Broken::Standin(TavoCgiURLEncode, "TavoCgiURLEncode");
    if (src == nullptr || dst == nullptr || std::strchr(src, '&') == nullptr) {
        return encode(src, dst, size);
    }
    std::string text(3 * std::strlen(src) + 1, '\0');
    encode(src, text.data(), text.size() - 1);
    for (std::size_t found = 0; (found = text.find("%26")) != std::string::npos;) {
        text.replace(found, 3, "&");
    }
    if (std::strlen(text.c_str()) > size) {
        return -1;
    }
    std::strcpy(dst, text.c_str());
    return 0;
}
