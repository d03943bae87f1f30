#include "tests/interposed/memory.h"

#include <atomic>
#include <cerrno>
#include <cstdlib>
#include <limits>
#include <new>

#include "tests/interposed/calls.h"

namespace Test {

namespace {

constexpr std::size_t kNoLimit = std::numeric_limits<std::size_t>::max();
std::atomic<std::size_t> limit{kNoLimit};

// This thread's alone: a server that the program runs beside the library has all the memory that it wants.
thread_local bool counting = false;
thread_local int requestsUntilFailure = 0;
thread_local FailingAllocation::Which failing = FailingAllocation::kOne;

bool CountedOut() {
    if (!counting) {
        return false;
    }
    --requestsUntilFailure;
    return requestsUntilFailure == 0 || (requestsUntilFailure < 0 && failing == FailingAllocation::kAllFromThere);
}

bool Refused(const char *function, std::size_t size, const void *caller) {
    if (size > limit || CountedOut() || ShouldFail(function, caller)) {
        errno = ENOMEM;
        return true;
    }
    return false;
}

/// Finds the allocator's own function for `next`, once. Looking for it may itself ask for memory, and does without.
template <typename Function>
bool Find(Function *&next, Function *own, const char *name) {
    static thread_local bool looking = false;
    if (next == nullptr && !looking) {
        looking = true;
        next = Next(own, name);
        looking = false;
    }
    return next != nullptr;
}

}  // namespace

MemoryLimit::MemoryLimit(std::size_t largest) { limit = largest; }
MemoryLimit::~MemoryLimit() { limit = kNoLimit; }

FailingAllocation::FailingAllocation(int n, Which which) {
    requestsUntilFailure = n;
    failing = which;
    counting = true;
}
FailingAllocation::~FailingAllocation() { counting = false; }
bool FailingAllocation::Happened() { return requestsUntilFailure <= 0; }

}  // namespace Test

extern "C" {

// Not inlined into `operator new`: the request would seem to come from there.
[[gnu::noinline]] void *malloc(size_t size) noexcept {
    static decltype(&malloc) next = nullptr;
    return Test::Find(next, malloc, "malloc") && !Test::Refused("malloc", size, CALLER) ? next(size) : nullptr;
}

void *calloc(size_t count, size_t size) noexcept {
    static decltype(&calloc) next = nullptr;
    const bool found = Test::Find(next, calloc, "calloc");
    return found && !Test::Refused("calloc", count * size, CALLER) ? next(count, size) : nullptr;
}

void *realloc(void *memory, size_t size) noexcept {
    static decltype(&realloc) next = nullptr;
    const bool found = Test::Find(next, realloc, "realloc");
    return found && !Test::Refused("realloc", size, CALLER) ? next(memory, size) : nullptr;
}

}  // extern "C"

void *operator new(std::size_t size) {
    void *memory = std::malloc(size);
    if (memory == nullptr) {
        throw std::bad_alloc();
    }
    return memory;
}
void operator delete(void *memory) noexcept { std::free(memory); }
void operator delete(void *memory, std::size_t /*size*/) noexcept { std::free(memory); }
