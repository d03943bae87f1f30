#ifndef TAVOSSO_TESTS_SUPPORT_INTERPOSED_MEMORY_H
#define TAVOSSO_TESTS_SUPPORT_INTERPOSED_MEMORY_H

#include <cstddef>

// Defines malloc, calloc, realloc and `operator new` for all libraries of the program.
namespace Test {

/// Makes each request for more memory than `largest` fail.
class MemoryLimit {
  public:
    explicit MemoryLimit(std::size_t largest);
    ~MemoryLimit();
    MemoryLimit(const MemoryLimit &) = delete;
    MemoryLimit &operator=(const MemoryLimit &) = delete;
};

/// Makes the n-th request for memory of this thread fail (1: the next), until stopped or destroyed.
class FailingAllocation {
  public:
    enum class Of {
        kEveryone,
        kCxx,  // `operator new`, and malloc calls of the library and of jsoncpp
    };
    enum class Until { kNext, kEver };

    explicit FailingAllocation(int n, Of of = Of::kEveryone, Until until = Until::kNext);
    ~FailingAllocation();
    FailingAllocation(const FailingAllocation &) = delete;
    FailingAllocation &operator=(const FailingAllocation &) = delete;

    void Stop();

    /// Whether the n-th request was made.
    bool Happened();
};

/// Fills new memory of this thread, so that remains of earlier blocks are not found in new ones.
void FillNewMemory(bool fill);

}  // namespace Test

#endif
