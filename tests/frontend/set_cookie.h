#ifndef TAVOSSO_TESTS_FRONTEND_SET_COOKIE_H
#define TAVOSSO_TESTS_FRONTEND_SET_COOKIE_H

#include <string>

#include "web/web.h"

namespace Frontend {

/// The value of the response's last Set-Cookie header; empty if it has none.
inline std::string LastSetCookie(const TAVO::Web::Response &response) {
    std::string last;
    for (const auto &[name, value] : response.headers) {
        if (name == "Set-Cookie") {
            last = value;
        }
    }
    return last;
}

}  // namespace Frontend

#endif
