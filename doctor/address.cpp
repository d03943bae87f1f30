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
    if (curl_url_get(url, part, &text, CURLU_DEFAULT_PORT) != CURLUE_OK) {
        return {};
    }
    const std::unique_ptr<char, void (*)(void *)> owner(text, curl_free);
    return text;
}

}  // namespace

Address SplitAddress(const std::string &url) {
    const std::unique_ptr<CURLU, CloseURL> parsed(curl_url());
    if (!parsed || curl_url_set(parsed.get(), CURLUPART_URL, url.c_str(), CURLU_NON_SUPPORT_SCHEME) != CURLUE_OK) {
        return {};
    }
    return {true,
            Piece(parsed.get(), CURLUPART_SCHEME),
            Piece(parsed.get(), CURLUPART_HOST),
            Piece(parsed.get(), CURLUPART_PORT),
            Piece(parsed.get(), CURLUPART_PATH),
            Piece(parsed.get(), CURLUPART_QUERY),
            Piece(parsed.get(), CURLUPART_FRAGMENT)};
}

}  // namespace Doctor
