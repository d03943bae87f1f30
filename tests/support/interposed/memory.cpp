#include "tests/support/interposed/memory.h"

#include <malloc.h>

#include <atomic>
#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <limits>
#include <new>

#include "tests/support/interposed/calls.h"

namespace Test {

namespace {

constexpr std::size_t kNoLimit = std::numeric_limits<std::size_t>::max();
std::atomic<std::size_t> limit{kNoLimit};

// Per thread, so that servers in the same process do not run out of memory.
thread_local bool counting = false;
thread_local int requestsUntilFailure = 0;
thread_local FailingAllocation::Of countedRequests{};
thread_local FailingAllocation::Until failing{};
thread_local bool filling = false;

bool IsToFail(bool ofCxx) {
    if (!counting || (countedRequests == FailingAllocation::Of::kCxx && !ofCxx)) {
        return false;
    }
    --requestsUntilFailure;
    return requestsUntilFailure == 0 || (requestsUntilFailure < 0 && failing == FailingAllocation::Until::kEver);
}

bool Refused(const char *function, std::size_t size, const void *caller) {
    const bool ofCxx = FromLibrary(caller) || FromJsonLibrary(caller);
    if (size > limit || IsToFail(ofCxx) || ShouldFail(function, caller)) {
        errno = ENOMEM;
        return true;
    }
    return false;
}

/// Finds the allocator's function once. Allocations during the search fail.
template <typename Function>
bool Find(Function *&next, Function *own, const char *name) {
    static thread_local bool searching = false;
    if (next == nullptr && !searching) {
        searching = true;
        next = Next(own, name);
        searching = false;
    }
    return next != nullptr;
}

void *Filled(void *memory) {
    return filling && memory != nullptr ? std::memset(memory, 0x55, malloc_usable_size(memory)) : memory;
}

}  // namespace

MemoryLimit::MemoryLimit(std::size_t largest) { limit = largest; }
MemoryLimit::~MemoryLimit() { limit = kNoLimit; }

FailingAllocation::FailingAllocation(int n, Of of, Until until) {
    requestsUntilFailure = n;
    countedRequests = of;
    failing = until;
    counting = true;
}
FailingAllocation::~FailingAllocation() { Stop(); }
void FailingAllocation::Stop() { counting = false; }
bool FailingAllocation::Happened() { return requestsUntilFailure <= 0; }

void FillNewMemory(bool fill) { filling = fill; }

}  // namespace Test

extern "C" {

void *malloc(size_t size) noexcept {
    static decltype(&malloc) next = nullptr;
    return Test::Find(next, malloc, "malloc") && !Test::Refused("malloc", size, CALLER) ? Test::Filled(next(size))
                                                                                        : nullptr;
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
    static decltype(&malloc) next = nullptr;
    const bool refused = size > Test::limit || Test::IsToFail(true);
    void *memory = !refused && Test::Find(next, std::malloc, "malloc") ? Test::Filled(next(size)) : nullptr;
    if (memory == nullptr) {
        errno = ENOMEM;
        throw std::bad_alloc();
    }
    return memory;
}
// The sanitizer would otherwise provide it, and reject the release by free.
void *operator new(std::size_t size, const std::nothrow_t & /*tag*/) noexcept {
    try {
        return operator new(size);
    } catch (const std::bad_alloc &) {
        return nullptr;
    }
}
void operator delete(void *memory) noexcept { std::free(memory); }
void operator delete(void *memory, std::size_t /*size*/) noexcept { std::free(memory); }
