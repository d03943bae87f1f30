#include "doctor/address.h"

#include <curl/curl.h>

#include <memory>

namespace Doctor {

namespace {

struct CloseURL {
    void operator()(CURLU *url) const { curl_url_cleanup(url); }
};

std::string Piece(CURLU *url, CURLUPart part) {
    char *text = nullptr;
    if (curl_url_get(url, part, &text, 0) != CURLUE_OK) {
        return {};
    }
    const std::unique_ptr<char, void (*)(void *)> owner(text, curl_free);
    return text;
}

}  // namespace

Address SplitAddress(const std::string &text) {
    const std::unique_ptr<CURLU, CloseURL> url(curl_url());
    if (!url || curl_url_set(url.get(), CURLUPART_URL, text.c_str(), CURLU_NON_SUPPORT_SCHEME) != CURLUE_OK) {
        return {};
    }
    return {true,
            Piece(url.get(), CURLUPART_SCHEME),
            Piece(url.get(), CURLUPART_HOST),
            Piece(url.get(), CURLUPART_PATH),
            Piece(url.get(), CURLUPART_QUERY),
            Piece(url.get(), CURLUPART_FRAGMENT)};
}

}  // namespace Doctor
