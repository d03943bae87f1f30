#include "bench/support/allocations.h"

#include <stdatomic.h>
#include <stddef.h>

// The C library's own, under the names by which it is still reached when a program defines the others.
void *__libc_malloc(size_t size);
void *__libc_calloc(size_t count, size_t size);
void *__libc_realloc(void *memory, size_t size);

static atomic_ulong allocations;
static atomic_ulong bytes;

// No atomic addition, which would take as long as a small malloc: of two threads at the same place one may go
// uncounted.
static void Add(atomic_ulong *sum, unsigned long number) {
    const unsigned long before = atomic_load_explicit(sum, memory_order_relaxed);
    atomic_store_explicit(sum, before + number, memory_order_relaxed);
}

static void Count(size_t size) {
    Add(&allocations, 1);
    Add(&bytes, size);
}

unsigned long AllocationCount(void) { return atomic_load_explicit(&allocations, memory_order_relaxed); }
unsigned long AllocatedBytes(void) { return atomic_load_explicit(&bytes, memory_order_relaxed); }

void *malloc(size_t size) {
    Count(size);
    return __libc_malloc(size);
}

void *calloc(size_t count, size_t size) {
    Count(count * size);
    return __libc_calloc(count, size);
}

void *realloc(void *memory, size_t size) {
    Count(size);
    return __libc_realloc(memory, size);
}
