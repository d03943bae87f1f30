#ifndef TAVOSSO_FRONTEND_FAILURE_H
#define TAVOSSO_FRONTEND_FAILURE_H

#include <exception>
#include <stdexcept>
#include <string>

#include "frontend/answer.h"

namespace Frontend {

/// The front end itself declines; the text is meant for the user.
class Refusal : public std::runtime_error {
  public:
    using std::runtime_error::runtime_error;
};

/// What a user and the log may be told of an exception. Its text may be the provider's whole answer, a token with it:
/// of that, only the error that it names.
std::string ReasonOf(const std::exception &failure);

/// The error that a provider names, in its own words (RFC 6749, sections 4.1.2.1 and 5.2).
std::string ProviderError(const std::string &error, const std::string &description);

/// The main function of a CGI program: whatever fails in `serve` is one line of log and a relay page with a reason. The
/// program ends by SIGALRM if it runs too long, as the library waits for the provider without a limit.
int Serve(void (*serve)(Answer &));

}  // namespace Frontend

#endif
