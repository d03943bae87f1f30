#include "web/cookie.h"

#include <boost/algorithm/string.hpp>
#include <vector>

namespace TAVO::Web {

namespace {

/// Returns all values of a cookie. A cookie without "=" has an empty value.
std::vector<std::string> ValuesOf(const std::string &header, const std::string &name) {
    std::vector<std::string> pieces;
    boost::split(pieces, header, boost::is_any_of(";"));
    std::vector<std::string> values;
    for (std::string &piece : pieces) {
        boost::trim_left_if(piece, boost::is_any_of(" "));
        if (piece == name) {
            values.emplace_back();
        } else if (boost::starts_with(piece, name + "=")) {
            values.push_back(piece.substr(name.size() + 1));
        }
    }
    return values;
}

}  // namespace

std::string MakeCookie(const std::string &name, const std::string &value, const std::string &more) {
    // Lax: with Strict, the browser would not send the cookie when the provider redirects it here.
    return name + "=" + value + "; Path=/; Secure; HttpOnly; SameSite=Lax" + more;
}

bool HasCookie(const std::string &header, const std::string &name) { return !ValuesOf(header, name).empty(); }

std::optional<std::string> FindCookie(const std::string &header, const std::string &name) {
    const std::vector<std::string> values = ValuesOf(header, name);
    return values.size() == 1 ? std::optional(values.front()) : std::nullopt;
}

}  // namespace TAVO::Web
