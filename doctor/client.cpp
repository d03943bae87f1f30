#include "doctor/client.h"

#include <sso/supported_profiles.h>

#include "doctor/watch.h"
#include "web/text.h"

namespace Doctor {

std::string NameOf(Profile profile) {
    return profile == Profile::kAzure ? TAVO::SSO::kAzureProfile : TAVO::SSO::kWebSphereProfile;
}

Profile ProfileNamed(const std::string &name) {
    for (const Profile profile : {Profile::kAzure, Profile::kWebSphere}) {
        if (name == NameOf(profile)) {
            return profile;
        }
    }
    throw TAVO::SSO::sso_exception("profile not support.");
}

std::vector<std::string> AlgorithmsOf(Profile profile) {
    return profile == Profile::kAzure ? std::vector<std::string>{"RS256", "RS384", "RS512"}
                                      : std::vector<std::string>{"HS256", "HS384", "HS512"};
}

void AzureClient::RequestWellknownInfo(Json::Value &out) {
    if (!mayFetch) {
        throw not_fetched();
    }
    AzureSSOClient::RequestWellknownInfo(out);
}

Client::Client(Profile profile)
    : profile_(profile),
      client_(profile == Profile::kAzure ? Library(std::in_place_type<AzureClient>)
                                         : Library(std::in_place_type<TAVO::SSO::WebSphereSSOClient>)) {}

TAVO::SSO::SSOClient *Client::operator->() {
    return std::visit([](auto &client) -> TAVO::SSO::SSOClient * { return &client; }, client_);
}

std::string Client::AuthorizationURI(const Json::Value &state) {
    return std::visit([&](auto &client) { return client.GetAccessTokenReqURI(state); }, client_);
}

std::optional<std::string> RefusalOfProfile() {
    const RefuseTransfers refuse;
    std::string refusal;
    try {
        std::string userName;
        TAVO::SSO::OIDCLogin("", userName);
    } catch (const std::exception &failure) {
        refusal = failure.what();
    }
    // The first step of the client is a transfer. Without one, the profile was refused.
    const bool isAccepted = !TakeTransfers().empty();
    TakeLogLines();
    return isAccepted ? std::nullopt : std::optional(refusal);
}

std::string ErrorText(const Json::Value &answer) {
    const std::string error = TAVO::Web::StringMember(answer, "error");
    const std::string description = TAVO::Web::StringMember(answer, "error_description");
    return "The provider refused: " + (error.empty() ? "unknown error" : error) +
           (description.empty() ? "" : " (" + description + ")");
}

std::string TextOf(const std::exception &failure) {
    const std::string text = failure.what();
    return text.empty() || text.front() != '{' ? text : ErrorText(TAVO::Web::ParseObject(text));
}

}  // namespace Doctor
