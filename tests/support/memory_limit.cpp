#include "tests/support/memory_limit.h"

#include <atomic>
#include <cstdlib>
#include <limits>
#include <new>

namespace Test {

namespace {

constexpr std::size_t kNoLimit = std::numeric_limits<std::size_t>::max();
std::atomic<std::size_t> limit{kNoLimit};
std::atomic<int> requestsUntilFailure{0};

}  // namespace

MemoryLimit::MemoryLimit(std::size_t largest) { limit = largest; }
MemoryLimit::~MemoryLimit() { limit = kNoLimit; }

FailingAllocation::FailingAllocation(int n) { requestsUntilFailure = n; }
FailingAllocation::~FailingAllocation() { requestsUntilFailure = 0; }
bool FailingAllocation::Happened() { return requestsUntilFailure <= 0; }

}  // namespace Test

void *operator new(std::size_t size) {
    const bool fails = size > Test::limit || --Test::requestsUntilFailure == 0;
    void *memory = fails ? nullptr : std::malloc(size);
    if (memory == nullptr) {
        throw std::bad_alloc();
    }
    return memory;
}
void operator delete(void *memory) noexcept { std::free(memory); }
void operator delete(void *memory, std::size_t /*size*/) noexcept { std::free(memory); }
