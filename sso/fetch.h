#ifndef TAVOSSO_SSO_FETCH_H
#define TAVOSSO_SSO_FETCH_H

#include <json/json.h>

#include <cstddef>
#include <string>

namespace TAVO::SSO {

/// The libcurl write callback of every exchange with a provider: appends the chunk, up to its first NUL, to the
/// std::string that `response` points to. A chunk that memory does not suffice for is refused, and the transfer fails.
std::size_t AppendChunk(char *data, std::size_t size, std::size_t count, void *response) noexcept;

/// Fetches a document that the provider publishes. Throws as httpGet does, and sso_err_resp "bad wellknown json
/// format." for one that is not JSON.
void FetchJson(const std::string &uri, Json::Value &document);

}  // namespace TAVO::SSO

#endif
