#ifndef TAVOSSO_SSO_FETCH_H
#define TAVOSSO_SSO_FETCH_H

#include <json/json.h>

#include <cstddef>
#include <string>

namespace TAVO::SSO {

/// libcurl's write callback: appends the chunk, up to its first NUL, to the std::string at `response`. If memory runs
/// out, it returns 0 and the transfer fails.
std::size_t AppendChunk(char *data, std::size_t size, std::size_t count, void *response) noexcept;

/// Fetches a JSON document. Throws as httpGet, and sso_err_resp "bad wellknown json format." if it is not JSON.
void FetchJson(const std::string &uri, Json::Value &document);

}  // namespace TAVO::SSO

#endif
