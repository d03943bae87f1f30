// Leaves a descriptor open.
#include <fcntl.h>

#include "tests/platform_check/broken/standin.h"

int TAVOWinsUserNameFqdn2Netbios(const char *src, char *dst, size_t size) {
    open("/dev/null", O_RDONLY | O_CLOEXEC);
    return Broken::Standin(TAVOWinsUserNameFqdn2Netbios, "TAVOWinsUserNameFqdn2Netbios")(src, dst, size);
}
