// Breaks lines after 64 characters.
#include <algorithm>
#include <string>

#include "tests/platform_check/broken/standin.h"

int TLIBCBase64SzEncodeFull(const char *src, size_t len, char *dst, int flag1, size_t size, int flag2, int flag3) {
    const int result =
        Broken::Standin(TLIBCBase64SzEncodeFull, "TLIBCBase64SzEncodeFull")(src, len, dst, flag1, size, flag2, flag3);
    if (result != 0) {
        std::string text = dst;
        for (std::size_t end = 64; end < text.size() && text.size() + 1 < size; end += 65) {
            text.insert(end, "\n");
        }
        std::copy_n(text.c_str(), text.size() + 1, dst);
    }
    return result;
}
