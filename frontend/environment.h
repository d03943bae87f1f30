#ifndef TAVOSSO_FRONTEND_ENVIRONMENT_H
#define TAVOSSO_FRONTEND_ENVIRONMENT_H

#include <cstddef>
#include <string>

#include "web/web.h"

// The environment of a CGI program: the request (RFC 3875), and settings that the web server passes.
namespace Frontend {

/// Returns a variable; empty if it is not set.
std::string Variable(const char *name);

/// The browser's request.
TAVO::Web::Request ReceivedRequest();

/// Returns whether the method is HEAD. Such a request must not start or finish a login.
bool IsHeadRequest();

/// FRONTEND_ACCEPT_EMAIL: whether an unverified "email" may name a user.
bool AcceptsUnverifiedEmail();

/// FRONTEND_PENDING_LOGINS: maximum number of pending logins. Throws `Refusal` unless it is a number above 0.
std::size_t MostPendingLogins();

/// Removes variables that change what OpenSSL and libcurl trust. Keeps those in FRONTEND_KEEP_ENVIRONMENT, separated by
/// blanks.
void RemoveUntrustedVariables();

}  // namespace Frontend

#endif
