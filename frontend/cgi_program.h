#ifndef TAVOSSO_FRONTEND_CGI_PROGRAM_H
#define TAVOSSO_FRONTEND_CGI_PROGRAM_H

#include <string>

#include "web/web.h"

namespace Frontend {

namespace Web = TAVO::Web;

/// After how many seconds a program ends itself.
extern const unsigned int kLongestRun;

/**
 * The main function of a CGI program. What `serve` throws becomes one line in the log and a relay page with a reason. A
 * request with a method that is not in `methods`, as in an Allow header, is answered with status 405.
 *
 * Side effects on the process: it writes no core file and cannot be traced; its address space is limited; variables
 * of the environment that change what the libraries below trust are removed, unless FRONTEND_KEEP_ENVIRONMENT names
 * them; it ends by SIGALRM if it runs too long.
 *
 * @return the exit status: 1 if the answer could not be written
 */
int Serve(const std::string &methods, void (*serve)(Web::Response &));

/// Logs the reason why a sign-in failed, and sends the browser to the relay page. "Try again" leads back to `origin`.
void Fail(Web::Response &response, const std::string &reason, const std::string &origin);

}  // namespace Frontend

#endif
