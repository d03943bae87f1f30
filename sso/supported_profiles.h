#ifndef TAVOSSO_SSO_SUPPORTED_PROFILES_H
#define TAVOSSO_SSO_SUPPORTED_PROFILES_H

#include <algorithm>
#include <iterator>
#include <string>

#include "sso/sso.h"

// The supported profiles and their clients.
namespace TAVO::SSO {

constexpr char kAzureProfile[] = "azure";
constexpr char kWebSphereProfile[] = "websphere";
constexpr const char *kSupportedProfiles[] = {kAzureProfile, kWebSphereProfile};

inline bool IsSupported(const std::string &profile) {
    return std::find(std::begin(kSupportedProfiles), std::end(kSupportedProfiles), profile) !=
           std::end(kSupportedProfiles);
}

/// Calls `use` with a new client of the profile and returns its result. Throws sso_exception "profile not support." for
/// any other name. `Azure` may be a class derived from AzureSSOClient.
template <typename Azure = AzureSSOClient, typename Use>
auto WithClient(const std::string &profile, Use use) {
    if (profile == kAzureProfile) {
        Azure client;
        return use(client);
    }
    if (profile == kWebSphereProfile) {
        WebSphereSSOClient client;
        return use(client);
    }
    throw sso_exception("profile not support.");
}

}  // namespace TAVO::SSO

#endif
