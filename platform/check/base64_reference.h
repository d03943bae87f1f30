#ifndef TAVOSSO_PLATFORM_CHECK_BASE64_REFERENCE_H
#define TAVOSSO_PLATFORM_CHECK_BASE64_REFERENCE_H

#include <cstddef>
#include <string>
#include <vector>

// Base64 (RFC 4648, section 4), independent of the functions that are checked.
namespace PlatformCheck {

constexpr char kBase64Alphabet[] = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";

/// Returns the canonical text.
std::string Base64(const std::string &bytes);

/// Returns texts of 0 to 48 bytes, and each byte in each position of a group of three.
std::vector<std::string> ShortInputs();

/// Returns a text that contains all bytes.
std::string LongInput(std::size_t size);

}  // namespace PlatformCheck

#endif
