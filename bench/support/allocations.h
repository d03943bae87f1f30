#ifndef TAVOSSO_BENCH_SUPPORT_ALLOCATIONS_H
#define TAVOSSO_BENCH_SUPPORT_ALLOCATIONS_H

// What the process has asked malloc, calloc and realloc for since it started, its libraries and operator new included:
// a program that is linked with this has functions of its own for the three.
#ifdef __cplusplus
extern "C" {
#endif

unsigned long AllocationCount(void);
unsigned long AllocatedBytes(void);

#ifdef __cplusplus
}
#endif

#endif
