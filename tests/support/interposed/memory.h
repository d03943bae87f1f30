#ifndef TAVOSSO_TESTS_SUPPORT_INTERPOSED_MEMORY_H
#define TAVOSSO_TESTS_SUPPORT_INTERPOSED_MEMORY_H

#include <cstddef>

// The program that links this defines malloc, calloc, realloc and `operator new` itself, for every library in it.
namespace Test {

/// While it lives, a single request for more memory than that fails.
class MemoryLimit {
  public:
    explicit MemoryLimit(std::size_t largest);
    ~MemoryLimit();
    MemoryLimit(const MemoryLimit &) = delete;
    MemoryLimit &operator=(const MemoryLimit &) = delete;
};

/// Until it is stopped or gone, the n-th request of this thread for memory (1: the next) fails, of whatever size.
class FailingAllocation {
  public:
    enum class Of {
        kEveryone,
        kCxx,  // of the C++ code: whatever goes through `operator new`, and of the library under test and of jsoncpp
    };
    enum class Until { kNext, kEver };

    explicit FailingAllocation(int n, Of of = Of::kEveryone, Until until = Until::kNext);
    ~FailingAllocation();
    FailingAllocation(const FailingAllocation &) = delete;
    FailingAllocation &operator=(const FailingAllocation &) = delete;

    void Stop();

    /// Whether there were n requests.
    bool Happened();
};

/// Whether this thread's memory comes filled: what a block's last owner has left in it would be taken for the next
/// one's.
void FillNewMemory(bool fill);

}  // namespace Test

#endif
