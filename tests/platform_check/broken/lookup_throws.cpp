// Copies the name, and does not catch the exception for null.
#include <string>

#include "tests/platform_check/broken/standin.h"

int TAVOWinsUserNameFqdn2Netbios(const char *src, char *dst, size_t size) {
    const std::string name(src);
    return Broken::Standin(TAVOWinsUserNameFqdn2Netbios, "TAVOWinsUserNameFqdn2Netbios")(name.c_str(), dst, size);
}
