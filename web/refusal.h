#ifndef TAVOSSO_WEB_REFUSAL_H
#define TAVOSSO_WEB_REFUSAL_H

#include <exception>
#include <stdexcept>
#include <string>

namespace TAVO::Web {

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

}  // namespace TAVO::Web

#endif
