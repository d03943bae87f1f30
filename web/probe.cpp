#include "web/probe.h"

#include <curl/curl.h>
#include <sso/sso.h>

#include <memory>

#include "web/failure.h"
#include "web/text.h"

namespace TAVO::Web {

namespace {

constexpr char kAuthorities[] = "/etc/ssl/certs/ca-certificates.crt";
constexpr long kSeconds = 5;
constexpr std::size_t kLongestDocument = std::size_t{1} << 20;

struct CleanUpHandle {
    void operator()(CURL *handle) const { curl_easy_cleanup(handle); }
};

std::size_t AppendChunk(char *data, std::size_t size, std::size_t count, void *document) noexcept {
    auto &text = *static_cast<std::string *>(document);
    if (text.size() + size * count > kLongestDocument) {
        return 0;
    }
    try {
        text.append(data, size * count);
    } catch (...) {
        return 0;  // an exception must not pass through libcurl
    }
    return size * count;
}

CURLcode Get(const std::string &address, std::string &document) {
    const std::unique_ptr<CURL, CleanUpHandle> handle(curl_easy_init());
    if (!handle) {
        return CURLE_OUT_OF_MEMORY;
    }
    document.clear();
    curl_easy_setopt(handle.get(), CURLOPT_URL, address.c_str());
    curl_easy_setopt(handle.get(), CURLOPT_CAINFO, kAuthorities);
    curl_easy_setopt(handle.get(), CURLOPT_TIMEOUT, kSeconds);
    curl_easy_setopt(handle.get(), CURLOPT_NOSIGNAL, 1L);
    curl_easy_setopt(handle.get(), CURLOPT_WRITEFUNCTION, AppendChunk);
    curl_easy_setopt(handle.get(), CURLOPT_WRITEDATA, &document);
    return curl_easy_perform(handle.get());
}

FailedLogin FindCauseOfMissingKey(const FailedLogin &failed, const std::string &wellknown) {
    std::string document;
    CURLcode result = Get(wellknown, document);
    const std::string keySet = StringMember(ParseObject(document), "jwks_uri");
    if (result == CURLE_OK && keySet.rfind("https://", 0) == 0) {
        result = Get(keySet, document);
    }
    if (result != CURLE_OK) {
        return FailedTransfer(failed, result);
    }
    return ParseObject(document)["keys"].isArray() ? failed : UnusableDocuments(failed);
}

}  // namespace

FailedLogin FindCause(FailedLogin failed) noexcept {
    try {
        SSO::SSOProfile profile;
        SSO::SSOClient &client = *profile.GetSSOClient();
        if (failed.failure == Failure::kUnknownKey) {
            return FindCauseOfMissingKey(failed, client.GetWellknownEndpoint());
        }
        if (failed.failure == Failure::kInvalidResponse) {
            std::string document;
            const CURLcode result = Get(client.GetTokenEndpoint(), document);
            return result == CURLE_OK ? failed : FailedTransfer(failed, result);
        }
    } catch (const std::exception &) {
        // Report the original failure.
    }
    return failed;
}

}  // namespace TAVO::Web
