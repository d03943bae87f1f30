#ifndef TAVOSSO_FRONTEND_CGI_PROGRAM_H
#define TAVOSSO_FRONTEND_CGI_PROGRAM_H

#include <string>

#include "web/web.h"

namespace Frontend {

namespace Web = TAVO::Web;

/// After this many seconds a program ends itself.
extern const unsigned int kLongestRun;

/**
 * The main function of a CGI program. Calls `serve`. An exception becomes one log line and a redirect to the relay
 * page. A method that is not in `methods`, which has the form of an Allow header, is answered with status 405.
 *
 * Side effects on the process: no core file; no tracing; a limit on its address space; SIGALRM ends it after
 * `kLongestRun`; `RemoveUntrustedVariables`.
 *
 * @return the exit status: 1 if the response could not be written
 */
int Serve(const std::string &methods, void (*serve)(Web::Response &));

/// Logs why a sign-in failed and redirects the browser to the relay page. "Try again" then returns to `origin`.
void Fail(Web::Response &response, const std::string &reason, const std::string &origin);

}  // namespace Frontend

#endif
