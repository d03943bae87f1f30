#ifndef TAVOSSO_TESTS_SUPPORT_ENCODING_H
#define TAVOSSO_TESTS_SUPPORT_ENCODING_H

#include <string>

// Encodings, independent of the code under test.
namespace Test {

std::string Base64(const std::string &bytes);

/// base64url (RFC 4648, section 5), without padding.
std::string Base64Url(const std::string &bytes);

/// The decoded bytes; empty if the text is not base64.
std::string FromBase64(const std::string &text);

std::string PercentDecode(const std::string &text);

}  // namespace Test

#endif
