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

}  // namespace Test

#endif
