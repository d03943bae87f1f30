#ifndef TAVOSSO_WEB_REFUSAL_H
#define TAVOSSO_WEB_REFUSAL_H

#include <exception>
#include <optional>
#include <stdexcept>
#include <string>

namespace TAVO::Web {

/// The front end rejects a login. The text is its reason for the log.
class Refusal : public std::runtime_error {
  public:
    using std::runtime_error::runtime_error;
};

/// The provider returned an error (RFC 6749, section 4.1.2.1).
class ProviderRefusal : public Refusal {
  public:
    ProviderRefusal(const std::string &error, const std::string &description);
    std::string error;  // empty if the provider named none
};

/// The store of logins failed, with any exception.
class StoreFailure : public std::runtime_error {
  public:
    using std::runtime_error::runtime_error;
};

/// The reason of an exception, on one line. If its text is the provider's whole response, which may contain tokens,
/// only the error in it.
std::string ReasonOf(const std::exception &failure);

/// The "error" of the provider's response that is the text of an exception (RFC 6749, section 5.2), or that a
/// `ProviderRefusal` carries. Nothing for every other exception.
std::optional<std::string> ProviderErrorOf(const std::exception &failure);

}  // namespace TAVO::Web

#endif
