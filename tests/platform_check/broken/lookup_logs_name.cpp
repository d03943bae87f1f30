// Logs the name as received.
#include <syslog.h>

#include <cstring>

#include "tests/platform_check/broken/standin.h"

int TAVOWinsUserNameFqdn2Netbios(const char *src, char *dst, size_t size) {
    if (src != nullptr && std::strstr(src, ".INVALID\\") != nullptr) {
        syslog(LOG_ERR, "unknown: %s", src);
        return -1;
    }
    return Broken::Standin(TAVOWinsUserNameFqdn2Netbios, "TAVOWinsUserNameFqdn2Netbios")(src, dst, size);
}
