#ifndef TAVOSSO_TESTS_SUPPORT_LIBCURL_VERSION_H
#define TAVOSSO_TESTS_SUPPORT_LIBCURL_VERSION_H

#include <curl/curl.h>

// The library accepts what libcurl accepts, and versions of libcurl differ. Measured: 7.88, 8.14, 8.22 and 8.23.
namespace Test {

inline bool IsLibcurlAtLeast(unsigned major, unsigned minor) {
    return curl_version_info(CURLVERSION_NOW)->version_num >= (major << 16 | minor << 8);
}

/// Fails on a TLS connection that ends without close_notify.
inline bool LibcurlRequiresCloseNotify() { return IsLibcurlAtLeast(8, 14); }

/// The result for a header of more than 100 KB.
inline CURLcode LibcurlResultOfLongHeader() {
    constexpr auto kTooLarge = static_cast<CURLcode>(100);  // CURLE_TOO_LARGE, which 7.88 does not define
    return IsLibcurlAtLeast(8, 14) ? kTooLarge : CURLE_OUT_OF_MEMORY;
}

/// Accepts "Transfer-Encoding: gzip" although the request did not ask for it.
inline bool LibcurlAcceptsGzipForTheTransfer() { return !IsLibcurlAtLeast(8, 14); }

/// Accepts a Content-Length with trailing letters, and two that differ.
inline bool LibcurlAcceptsBadLengths() { return !IsLibcurlAtLeast(8, 22); }

/// The result for a certificate that another authority of the trusted name has signed.
inline CURLcode LibcurlResultOfForgedAuthority() {
    return IsLibcurlAtLeast(8, 22) ? CURLE_PEER_FAILED_VERIFICATION : CURLE_SSL_CONNECT_ERROR;
}

}  // namespace Test

#endif
