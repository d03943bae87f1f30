#include "frontend/environment.h"

#include <charconv>
#include <cstdlib>

#include "web/refusal.h"

namespace Frontend {

namespace {

constexpr std::size_t kMostPendingLogins = 1000;

}  // namespace

std::string Variable(const char *name) {
    const char *value = std::getenv(name);
    return value != nullptr ? value : "";
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

}  // namespace Frontend
