#include "frontend/environment.h"

#include <algorithm>
#include <boost/algorithm/string.hpp>
#include <charconv>
#include <cstdlib>
#include <vector>

#include "web/refusal.h"

namespace Frontend {

namespace {

constexpr std::size_t kMostPendingLogins = 1000;

// OpenSSL and libcurl read these. They set a file for keys, modules to load, authorities and proxies.
constexpr const char *kUntrustedVariables[] = {
    "ALL_PROXY",    "CURL_CA_BUNDLE",  "CURL_HOME",       "HTTPS_PROXY",   "HTTP_PROXY",   "NO_PROXY",
    "OPENSSL_CONF", "OPENSSL_ENGINES", "OPENSSL_MODULES", "SSLKEYLOGFILE", "SSL_CERT_DIR", "SSL_CERT_FILE",
    "all_proxy",    "http_proxy",      "https_proxy",     "no_proxy",
};

}  // namespace

std::string Variable(const char *name) {
    const char *value = std::getenv(name);
    return value != nullptr ? value : "";
}

TAVO::Web::Request ReceivedRequest() {
    return {Variable("REQUEST_METHOD"), Variable("QUERY_STRING"), Variable("HTTP_COOKIE")};
}

bool IsHeadRequest() { return Variable("REQUEST_METHOD") == "HEAD"; }

bool AcceptsUnverifiedEmail() { return Variable("FRONTEND_ACCEPT_EMAIL") == "yes"; }

std::size_t MostPendingLogins() {
    const std::string configured = Variable("FRONTEND_PENDING_LOGINS");
    if (configured.empty()) {
        return kMostPendingLogins;
    }
    std::size_t most = 0;
    const char *end = configured.data() + configured.size();
    if (std::from_chars(configured.data(), end, most).ptr != end || most == 0) {
        throw TAVO::Web::Refusal("FRONTEND_PENDING_LOGINS must be a number above 0.");
    }
    return most;
}

void RemoveUntrustedVariables() {
    const std::string setting = Variable("FRONTEND_KEEP_ENVIRONMENT");
    std::vector<std::string> kept;
    boost::split(kept, setting, boost::is_any_of(" "));
    for (const char *name : kUntrustedVariables) {
        if (std::find(kept.begin(), kept.end(), name) == kept.end()) {
            unsetenv(name);
        }
    }
}

}  // namespace Frontend
