#include <curl/curl.h>
#include <openssl/md5.h>
#include <syslog.h>

#include <cstdio>
#include <cstdlib>
#include <memory>
#include <new>

#include "platform/platform.h"
#include "sso/sso.h"
#include "utils/cleanse.h"
#include "utils/source_line.h"

namespace TAVO::SSO {

namespace {

constexpr char kSourceName[] = "utils";

/// libcurl's global state during a transfer. Declare it before the handle, so that it is cleaned up after it.
struct CurlGlobalState {
    CurlGlobalState() { curl_global_init(CURL_GLOBAL_ALL); }
    ~CurlGlobalState() { curl_global_cleanup(); }
    CurlGlobalState(const CurlGlobalState &) = delete;
    CurlGlobalState &operator=(const CurlGlobalState &) = delete;
};

/// Throws sso_err_resp with libcurl's text on failure.
void Require(CURLcode result) {
    if (result != CURLE_OK) {
        throw sso_err_resp(curl_easy_strerror(result));
    }
}

/// Sends a request with a new handle: POST if there is a form, else GET.
void Transfer(const std::string &url, const std::string *form, std::string &response, bool verifySSL,
              curl_write_callback writeCallback) {
    const CurlGlobalState global;
    const std::shared_ptr<CURL> handle(curl_easy_init(), curl_easy_cleanup);
    if (!handle) {
        throw std::bad_alloc();
    }
    // curl_easy_perform reports a failure of this call.
    curl_easy_setopt(handle.get(), CURLOPT_URL, url.c_str());
    if (form != nullptr) {
        Require(curl_easy_setopt(handle.get(), CURLOPT_POSTFIELDS, form->c_str()));
    }
    // Without the callback, libcurl would write to `response` as if it were a FILE.
    Require(curl_easy_setopt(handle.get(), CURLOPT_WRITEFUNCTION, writeCallback));
    Require(curl_easy_setopt(handle.get(), CURLOPT_WRITEDATA, &response));
    if (!verifySSL) {
        curl_easy_setopt(handle.get(), CURLOPT_SSL_VERIFYHOST, 0L);
        curl_easy_setopt(handle.get(), CURLOPT_SSL_VERIFYPEER, 0L);
    }
    Require(curl_easy_perform(handle.get()));
}

/// Returns zeroed memory from calloc, or null.
std::shared_ptr<char> AllocateText(std::size_t size) { return {static_cast<char *>(std::calloc(size, 1)), std::free}; }

}  // namespace

void httpGet(const std::string &url, std::string &response, bool verifySSL,
             std::size_t (*writeCallback)(char *, std::size_t, std::size_t, void *)) {
    Transfer(url, nullptr, response, verifySSL, writeCallback);
}

void httpPost(const std::string &url, const std::string &body, std::string &response, bool verifySSL,
              std::size_t (*writeCallback)(char *, std::size_t, std::size_t, void *)) {
    Transfer(url, &body, response, verifySSL, writeCallback);
}

std::string URLEncode(const std::string &value) {
    const std::size_t usableSize = 3 * value.size();  // every byte may become "%XX"
    const std::shared_ptr<char> encoded = AllocateText(usableSize + 1);
    if (!encoded) {
        return value;
    }
    const Utils::CleanseOnExit cleanse(encoded.get(), usableSize);  // the value may be the client secret
    if (TavoCgiURLEncode(value.c_str(), encoded.get(), usableSize) != 0) {
        return value;
    }
    return encoded.get();
}

std::string MD5Digest(std::string data) {
    unsigned char digest[MD5_DIGEST_LENGTH];
#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Wdeprecated-declarations"
    // MD5 only links the state to the nonce; it need not resist collisions.
    if (MD5(reinterpret_cast<const unsigned char *>(data.data()), data.size(), digest) == nullptr) {
        syslog(LOG_ERR, "%s:%d MD5 digest failed %m", SOURCE_LINE);
        return {};
    }
#pragma GCC diagnostic pop
    const std::shared_ptr<char> text = AllocateText(2 * MD5_DIGEST_LENGTH + 1);
    if (!text) {
        syslog(LOG_ERR, "%s:%d calloc failed. %m", SOURCE_LINE);
        return {};
    }
    for (std::size_t i = 0; i < MD5_DIGEST_LENGTH; ++i) {
        std::snprintf(text.get() + 2 * i, 3, "%02x", digest[i]);
    }
    return text.get();
}

}  // namespace TAVO::SSO
