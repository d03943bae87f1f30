// Truncates a result that does not fit.
#include <algorithm>
#include <cstring>

#include "tests/platform_check/broken/standin.h"

int TAVOWinsUserNameFqdn2Netbios(const char *src, char *dst, size_t size) {
    char result[1024];
    if (Broken::Standin(TAVOWinsUserNameFqdn2Netbios, "TAVOWinsUserNameFqdn2Netbios")(
            src, dst != nullptr ? result : nullptr, sizeof result - 1) < 0) {
        return -1;
    }
    const size_t length = std::min(size, std::strlen(result));
    std::copy_n(result, length, dst);
    dst[length] = '\0';
    return 0;
}
