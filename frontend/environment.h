#ifndef TAVOSSO_FRONTEND_ENVIRONMENT_H
#define TAVOSSO_FRONTEND_ENVIRONMENT_H

#include <cstddef>
#include <string>

#include "web/web.h"

// The environment of a CGI program: its request (RFC 3875), and the front end's settings, which the web server sets.
namespace Frontend {

/// A variable, empty if it is not set.
std::string Variable(const char *name);

/// The browser's request.
TAVO::Web::Request ReceivedRequest();

/// Whether the request asks for the headers alone. Such a request must not start or complete a login.
bool IsHeadRequest();

/// FRONTEND_ACCEPT_EMAIL: whether "email" names a user although the provider has not verified it.
bool AcceptsUnverifiedEmail();

/// FRONTEND_PENDING_LOGINS: how many logins may be pending. Throws `Refusal` unless it is a number above 0.
std::size_t MostPendingLogins();

/// Removes the variables that change what OpenSSL and libcurl trust, except those that FRONTEND_KEEP_ENVIRONMENT names,
/// separated by blanks. All other variables reach libcurl.
void RemoveUntrustedVariables();

}  // namespace Frontend

#endif
