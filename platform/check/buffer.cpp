#include "platform/check/buffer.h"

#include "platform/check/promise.h"

namespace PlatformCheck {

namespace {

constexpr std::size_t kSpare = 4096;
constexpr char kMark = '\xa5';

}  // namespace

Buffer::Buffer(std::size_t size) : size_(size), bytes_(size + kSpare, kMark) {}

std::string Buffer::Text() const {
    const std::size_t end = bytes_.find('\0');
    Expect(end != std::string::npos, "there is no NUL in dst");
    return bytes_.substr(0, end);
}

bool Buffer::IsUntouched() const { return bytes_.find_first_not_of(kMark) == std::string::npos; }

}  // namespace PlatformCheck
