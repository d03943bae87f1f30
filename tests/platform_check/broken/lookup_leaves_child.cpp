// Does not wait for the child process that it starts.
#include <sys/wait.h>
#include <unistd.h>

#include "tests/platform_check/broken/standin.h"

int TAVOWinsUserNameFqdn2Netbios(const char *src, char *dst, size_t size) {
    const pid_t child = fork();
    if (child == 0) {
        _exit(0);
    }
    siginfo_t information = {};
    waitid(P_PID, static_cast<id_t>(child), &information, WEXITED | WNOWAIT);
    return Broken::Standin(TAVOWinsUserNameFqdn2Netbios, "TAVOWinsUserNameFqdn2Netbios")(src, dst, size);
}
