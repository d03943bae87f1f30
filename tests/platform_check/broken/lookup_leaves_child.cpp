// Does not wait for the child process that it starts.
#include <unistd.h>

#include "tests/platform_check/broken/standin.h"

int TAVOWinsUserNameFqdn2Netbios(const char *src, char *dst, size_t size) {
    if (fork() == 0) {
        _exit(0);
    }
    return Broken::Standin(TAVOWinsUserNameFqdn2Netbios, "TAVOWinsUserNameFqdn2Netbios")(src, dst, size);
}
