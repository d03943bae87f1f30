#ifndef TAVOSSO_TESTS_SUPPORT_OPENSSL_ERRORS_H
#define TAVOSSO_TESTS_SUPPORT_OPENSSL_ERRORS_H

#include <string>
#include <vector>

namespace Test {

/// Every entry of the calling thread's error queue of OpenSSL, and no more of them: "REASON FILE:LINE FUNCTION DATA".
std::vector<std::string> TakeErrorQueue();

}  // namespace Test

#endif
