#include "tests/support/memory_limit.h"

#include <atomic>
#include <cstdlib>
#include <limits>
#include <new>

namespace Test {

namespace {

constexpr std::size_t kNoLimit = std::numeric_limits<std::size_t>::max();
std::atomic<std::size_t> limit{kNoLimit};

}  // namespace

MemoryLimit::MemoryLimit(std::size_t largest) { limit = largest; }
MemoryLimit::~MemoryLimit() { limit = kNoLimit; }

}  // namespace Test

void *operator new(std::size_t size) {
    void *memory = size > Test::limit ? nullptr : std::malloc(size);
    if (memory == nullptr) {
        throw std::bad_alloc();
    }
    return memory;
}
void operator delete(void *memory) noexcept { std::free(memory); }
void operator delete(void *memory, std::size_t /*size*/) noexcept { std::free(memory); }
