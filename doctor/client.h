#ifndef TAVOSSO_DOCTOR_CLIENT_H
#define TAVOSSO_DOCTOR_CLIENT_H

#include <sso/sso.h>

#include <cstddef>
#include <exception>
#include <optional>
#include <string>
#include <variant>
#include <vector>

// The library's own clients, so that their decisions are the library's.
namespace Doctor {

enum class Profile { kAzure, kWebSphere };

std::string NameOf(Profile profile);

/// Throws sso_exception "profile not support." for a profile that the doctor cannot check.
Profile ProfileNamed(const std::string &name);

/// The signatures that the profile's client can verify.
std::vector<std::string> AlgorithmsOf(Profile profile);

/// In bytes, for HS256 (RFC 7518, section 3.2). The library accepts any.
constexpr std::size_t kShortestWebSphereKey = 32;

/// A request was not allowed.
class not_fetched : public std::exception {
  public:
    const char *what() const noexcept override { return "not fetched"; }
};

/// The Azure client. Verification ends before its first request unless `mayFetch`.
class AzureClient : public TAVO::SSO::AzureSSOClient {
  public:
    bool mayFetch = true;

    std::string GetTenantID() { return tenantID; }

    /// @throws not_fetched  unless it may
    void RequestWellknownInfo(Json::Value &out) override;
};

/// The client of a profile, with the settings of its file.
class Client {
  public:
    explicit Client(Profile profile);

    Profile profile() const { return profile_; }
    TAVO::SSO::SSOClient *operator->();
    std::string AuthorizationURI(const Json::Value &state);

    /// Null for another profile.
    AzureClient *Azure() { return std::get_if<AzureClient>(&client_); }

  private:
    using Library = std::variant<AzureClient, TAVO::SSO::WebSphereSSOClient>;

    Profile profile_;
    Library client_;
};

/// Returns the text of the exception that ends a login before it reaches the client, or nothing.
std::optional<std::string> RefusalOfProfile();

/// Returns "error" and "error_description" in the words of the front end. Does not cut them: part of a secret could not
/// be hidden.
std::string ErrorText(const Json::Value &answer);

/// Returns the text of an exception of the library. Of an error response of the provider, which may contain anything,
/// returns the error and its description only (RFC 6749, section 5.2).
std::string TextOf(const std::exception &failure);

}  // namespace Doctor

#endif
