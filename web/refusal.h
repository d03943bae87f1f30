#ifndef TAVOSSO_WEB_REFUSAL_H
#define TAVOSSO_WEB_REFUSAL_H

#include <exception>
#include <optional>
#include <stdexcept>
#include <string>

namespace TAVO::Web {

/// The front end rejected a login. The text is the reason for the log.
class Refusal : public std::runtime_error {
  public:
    using std::runtime_error::runtime_error;
};

/// The provider returned an error (RFC 6749, section 4.1.2.1).
class ProviderRefusal : public Refusal {
  public:
    ProviderRefusal(const std::string &error, const std::string &description);
    std::string providerError;  // empty if the provider sent none
};

/// The store of logins threw an exception.
class StoreFailure : public std::runtime_error {
  public:
    using std::runtime_error::runtime_error;
};

/// Returns the reason of an exception, on one line. If the text is the provider's whole response, which may contain
/// tokens, returns only its error.
std::string ReasonOf(const std::exception &failure);

/// Returns the "error" (RFC 6749, section 5.2) of a `ProviderRefusal`, or of an exception whose text is the provider's
/// response. Nothing for other exceptions.
std::optional<std::string> ProviderErrorOf(const std::exception &failure);

}  // namespace TAVO::Web

#endif
