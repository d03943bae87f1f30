#ifndef TAVOSSO_UTILS_CLEANSE_H
#define TAVOSSO_UTILS_CLEANSE_H

#include <openssl/crypto.h>

#include <cstddef>

namespace TAVO::Utils {

/// Overwrites memory that holds a secret on every way out of a scope. Declared after the memory's owner, so that it
/// runs before the memory is released.
class CleanseOnExit {
  public:
    CleanseOnExit(void *memory, std::size_t size) : memory_(memory), size_(size) {}
    ~CleanseOnExit() { OPENSSL_cleanse(memory_, size_); }
    CleanseOnExit(const CleanseOnExit &) = delete;
    CleanseOnExit &operator=(const CleanseOnExit &) = delete;

  private:
    void *memory_;
    std::size_t size_;
};

}  // namespace TAVO::Utils

#endif
