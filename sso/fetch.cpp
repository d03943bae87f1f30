#include "sso/fetch.h"

#include <cstring>

#include "sso/sso.h"
#include "utils/cleanse.h"
#include "utils/json.h"

namespace TAVO::SSO {

std::size_t AppendChunk(char *data, std::size_t size, std::size_t count, void *response) noexcept {
    const std::size_t length = size * count;
    try {
        Utils::AppendSecret(*static_cast<std::string *>(response), data, strnlen(data, length));
    } catch (...) {
        return 0;  // an exception through libcurl would leak the connection
    }
    return length;
}

void FetchJson(const std::string &uri, Json::Value &document) {
    std::string response;
    httpGet(uri, response, true, AppendChunk);
    if (!Utils::ParseJson(response, document)) {
        throw sso_err_resp("bad wellknown json format.");
    }
}

}  // namespace TAVO::SSO
