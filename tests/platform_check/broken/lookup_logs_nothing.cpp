// Logs nothing if the name has no domain.
#include <cstring>

#include "tests/platform_check/broken/standin.h"

int TAVOWinsUserNameFqdn2Netbios(const char *src, char *dst, size_t size) {
    if (src != nullptr && std::strchr(src, '\\') == nullptr) {
        return -1;
    }
    return Broken::Standin(TAVOWinsUserNameFqdn2Netbios, "TAVOWinsUserNameFqdn2Netbios")(src, dst, size);
}
