#ifndef TAVOSSO_PLATFORM_CHECK_BUFFER_H
#define TAVOSSO_PLATFORM_CHECK_BUFFER_H

#include <cstddef>
#include <string>

namespace PlatformCheck {

/// A marked buffer with spare bytes behind it. A function that writes too far breaks only the promise that is verified
/// with `GuardedOutput`.
class Buffer {
  public:
    explicit Buffer(std::size_t size);

    char *Data() { return bytes_.data(); }
    std::size_t Size() const { return size_; }

    /// Returns the bytes up to a NUL. Throws if there is none.
    std::string Text() const;
    std::string Bytes(std::size_t count) const { return bytes_.substr(0, count); }

    bool IsUntouched() const;

  private:
    std::size_t size_;
    std::string bytes_;
};

}  // namespace PlatformCheck

#endif
