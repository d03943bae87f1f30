#ifndef TAVOSSO_DOCTOR_CLIENT_H
#define TAVOSSO_DOCTOR_CLIENT_H

#include <sso/sso.h>

#include <cstddef>
#include <exception>
#include <optional>
#include <string>
#include <variant>
#include <vector>

// The library's own clients: whatever they can decide is decided by them.
namespace Doctor {

enum class Profile { kAzure, kWebSphere };

std::string NameOf(Profile profile);

/// Throws sso_exception "profile not support." for a profile that the doctor cannot check.
Profile ProfileNamed(const std::string &name);

/// The signatures that the profile's client can verify.
std::vector<std::string> AlgorithmsOf(Profile profile);

/// In bytes, of a key of HS256 (RFC 7518, section 3.2). The library takes any.
constexpr std::size_t kShortestWebSphereKey = 32;

/// In the place of a request that was not asked for.
class not_fetched : public std::exception {
  public:
    const char *what() const noexcept override { return "not fetched"; }
};

/// The Azure client, whose requests can be forbidden: its verification then ends where it would make the first one.
class AzureClient : public TAVO::SSO::AzureSSOClient {
  public:
    bool mayFetch = true;

    std::string GetTenantID() { return tenantID; }

    /// @throws not_fetched  unless it may
    void RequestWellknownInfo(Json::Value &out) override;
};

/// The client of the profile in force, as the library makes it of its file.
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

/// What a login says to the profile file: the text of the exception that ends it before a client is asked for anything;
/// nothing where it goes on.
std::optional<std::string> RefusalOfProfile();

/// What "error" and "error_description" of an answer tell, in the front end's words. It is as long as they are: of a
/// secret in them that was cut, the rest could not be found and hidden any more.
std::string ErrorText(const Json::Value &answer);

/// What an exception of the library says. An error answer of the provider, which may hold anything, is reduced to the
/// members that tell of the error (RFC 6749, section 5.2).
std::string TextOf(const std::exception &failure);

}  // namespace Doctor

#endif
