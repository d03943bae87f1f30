#ifndef TAVOSSO_SSO_LIMITS_H
#define TAVOSSO_SSO_LIMITS_H

#include <cstddef>

// The platform's buffers, and what they limit. In bytes.
namespace TAVO::SSO {

/// The size of each buffer that the platform fills.
constexpr std::size_t kPlatformBuffer = 1024;

/// The base64 text and its NUL fill the buffer.
constexpr std::size_t kLongestEncoded = (kPlatformBuffer - 1) / 4 * 3;

/// WebSphere: the client secret is encoded as the key of the tokens' signatures.
constexpr std::size_t kLongestSecret = kLongestEncoded;

/// The caller's state as compact JSON. The nonce's digest and a line feed are added, for which the NUL counts here.
constexpr std::size_t kLongestState = kLongestEncoded - sizeof R"(,"nonce":"0123456789abcdef0123456789abcdef")";

}  // namespace TAVO::SSO

#endif
