#ifndef TAVOSSO_PLATFORM_CHECK_GUARDED_MEMORY_H
#define TAVOSSO_PLATFORM_CHECK_GUARDED_MEMORY_H

#include <cstddef>
#include <string>

namespace PlatformCheck {

/// Memory that ends where an inaccessible page begins. An access to that page ends the child process, and is reported
/// as `fault`.
class GuardedMemory {
  public:
    GuardedMemory(std::size_t size, const char *fault);
    ~GuardedMemory();
    GuardedMemory(const GuardedMemory &) = delete;
    GuardedMemory &operator=(const GuardedMemory &) = delete;

    char *Data() const { return data_; }

  protected:
    char *pages_;
    std::size_t usable_;  // size of the accessible pages
    char *data_;
};

/// A copy of a function's input, which the function must not change.
class GuardedInput : public GuardedMemory {
  public:
    explicit GuardedInput(const std::string &bytes);
};

/// A buffer for a function's output.
class GuardedOutput : public GuardedMemory {
  public:
    explicit GuardedOutput(std::size_t size);
};

}  // namespace PlatformCheck

#endif
