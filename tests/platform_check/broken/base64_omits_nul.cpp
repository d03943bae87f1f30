// Accepts a text that fills the buffer, and omits its NUL.
#include <algorithm>
#include <vector>

#include "tests/platform_check/broken/standin.h"

int TLIBCBase64SzEncodeFull(const char *src, size_t len, char *dst, int flag1, size_t size, int flag2, int flag3) {
    const auto encode = Broken::Standin(TLIBCBase64SzEncodeFull, "TLIBCBase64SzEncodeFull");
    std::vector<char> text(size + 1);
    if (dst == nullptr || (size > 0 && encode(src, len, text.data(), flag1, size, flag2, flag3) != 0)) {
        return encode(src, len, dst, flag1, size, flag2, flag3);
    }
    const int result = encode(src, len, text.data(), flag1, size + 1, flag2, flag3);
    if (result != 0) {
        std::copy_n(text.begin(), size, dst);
    }
    return result;
}
