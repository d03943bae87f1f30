#ifndef TAVOSSO_TESTS_SUPPORT_MEMORY_LIMIT_H
#define TAVOSSO_TESTS_SUPPORT_MEMORY_LIMIT_H

#include <cstddef>

// The program that links this defines `operator new` itself.
namespace Test {

/// While it lives, a single request for more memory than that fails.
class MemoryLimit {
  public:
    explicit MemoryLimit(std::size_t largest);
    ~MemoryLimit();
    MemoryLimit(const MemoryLimit &) = delete;
    MemoryLimit &operator=(const MemoryLimit &) = delete;
};

/// While it lives, the n-th request for memory (1: the next) fails, of whatever size.
class FailingAllocation {
  public:
    explicit FailingAllocation(int n);
    ~FailingAllocation();
    FailingAllocation(const FailingAllocation &) = delete;
    FailingAllocation &operator=(const FailingAllocation &) = delete;

    /// Whether there were n requests.
    bool Happened();
};

}  // namespace Test

#endif
