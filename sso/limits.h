#ifndef TAVOSSO_SSO_LIMITS_H
#define TAVOSSO_SSO_LIMITS_H

#include <cstddef>

// The platform's buffer size and the limits that follow from it, in bytes.
namespace TAVO::SSO {

/// The size of each buffer that the platform fills.
constexpr std::size_t kPlatformBuffer = 1024;

/// The most bytes whose base64 text and NUL fit into the buffer.
constexpr std::size_t kLongestEncoded = (kPlatformBuffer - 1) / 4 * 3;

/// WebSphere's client secret, which is encoded as the key of the signature.
constexpr std::size_t kLongestSecret = kLongestEncoded;

/// The caller's state as compact JSON. The library adds the nonce's digest and a line feed (here the literal's NUL).
constexpr std::size_t kLongestState = kLongestEncoded - sizeof R"(,"nonce":"0123456789abcdef0123456789abcdef")";

}  // namespace TAVO::SSO

#endif
