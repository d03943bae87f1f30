#ifndef TAVOSSO_TESTS_SUPPORT_OPENSSL_ERRORS_H
#define TAVOSSO_TESTS_SUPPORT_OPENSSL_ERRORS_H

#include <string>
#include <vector>

namespace Test {

/// Returns and removes all entries of the thread's OpenSSL error queue, as "REASON FILE:LINE FUNCTION DATA".
std::vector<std::string> TakeErrorQueue();

}  // namespace Test

#endif
