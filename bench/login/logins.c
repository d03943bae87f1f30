#define _POSIX_C_SOURCE 200809L
#include "bench/login/logins.h"

#include <stdio.h>
#include <time.h>

#include "bench/support/allocations.h"

static double Microseconds(clockid_t clock) {
    struct timespec now;
    clock_gettime(clock, &now);
    return (double)now.tv_sec * 1e6 + (double)now.tv_nsec / 1e3;
}

void MeasureLogins(unsigned long logins, void (*logIn)(void)) {
    logIn();
    const unsigned long allocations = AllocationCount();
    const unsigned long bytes = AllocatedBytes();
    const double wall = Microseconds(CLOCK_MONOTONIC);
    const double cpu = Microseconds(CLOCK_PROCESS_CPUTIME_ID);
    for (unsigned long i = 0; i < logins; ++i) {
        logIn();
    }
    const double count = (double)logins;
    const double cpuOfOne = (Microseconds(CLOCK_PROCESS_CPUTIME_ID) - cpu) / count;
    const double wallOfOne = (Microseconds(CLOCK_MONOTONIC) - wall) / count;
    const double allocationsOfOne = (double)(AllocationCount() - allocations) / count;
    const double bytesOfOne = (double)(AllocatedBytes() - bytes) / count;
    printf("{\"cpu\": %.3f, \"wall\": %.3f, \"allocations\": %.3f, \"bytes\": %.3f}\n", cpuOfOne, wallOfOne,
           allocationsOfOne, bytesOfOne);
}
