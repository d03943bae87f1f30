#include "doctor/provider_errors.h"

#include <algorithm>
#include <boost/algorithm/string/case_conv.hpp>
#include <boost/algorithm/string/predicate.hpp>
#include <boost/algorithm/string/trim.hpp>
#include <cctype>
#include <utility>

namespace Doctor {

namespace {

constexpr char kAuthorization[] = "RFC 6749, section 4.1.2.1";
constexpr char kToken[] = "RFC 6749, section 5.2";
constexpr char kOpenIDConnect[] = "OpenID Connect Core 1.0, section 3.1.2.6";
constexpr char kAzureAD[] = "Microsoft Entra authentication and authorization error codes";

TAVO::Web::FailureRow Row(const char *code, const char *cause, const char *remedy, const char *source) {
    return {
        TAVO::Web::FailureKind::kProviderError, {code}, TAVO::Web::Failure::kProviderRefused, cause, remedy, source};
}

bool IsWordCharacter(char c) { return std::isalnum(static_cast<unsigned char>(c)) != 0 || c == '_'; }

}  // namespace

const std::vector<TAVO::Web::FailureRow> &ProviderErrors() {
    static const std::vector<TAVO::Web::FailureRow> errors = {
        Row("access_denied",
            "The user cancelled the sign-in, or the provider does not allow the user to use this client.",
            "Assign the user to the client at the provider.", kAuthorization),
        Row("invalid_request", "The provider does not accept a parameter of the request, often the redirect URI.",
            "Run `tavosso-doctor login` and read the provider's error page.", kAuthorization),
        Row("unauthorized_client", "The provider does not allow this client to use authorization codes.",
            "Allow the authorization code grant for the client at the provider.", kAuthorization),
        Row("unsupported_response_type", "The provider does not issue authorization codes to this client.",
            "Allow response type `code` for the client at the provider.", kAuthorization),
        Row("invalid_scope", "The provider does not know the scope `openid` for this client.",
            "Register the client for OpenID Connect at the provider.", kAuthorization),
        Row("server_error", "The provider failed.",
            "Sign in again later. The settings of this machine are not the cause.", kAuthorization),
        Row("temporarily_unavailable", "The provider is overloaded or under maintenance.",
            "Sign in again later. The settings of this machine are not the cause.", kAuthorization),
        Row("invalid_client", "The client id or the client secret is wrong, or the secret has expired.",
            "Compare the client id with the provider's. Create a new client secret there, and set it in the client's "
            "file.",
            kToken),
        Row("invalid_grant", "The code is expired, used, or was issued for another client or redirect URI.",
            "Sign in again. If it repeats, compare the redirect URI with the one that is registered at the provider.",
            kToken),
        Row("unsupported_grant_type", "The token endpoint does not exchange authorization codes.",
            "Compare the address of the token endpoint with the provider's.", kToken),
        Row("login_required", "The user has no session at the provider, and the provider may not ask for the password.",
            "Sign in at the provider, then sign in here again.", kOpenIDConnect),
        Row("interaction_required", "The provider must ask the user something, for example for a second factor.",
            "Sign in at the provider, then sign in here again.", kOpenIDConnect),
        Row("consent_required", "Neither the user nor an administrator has consented to this client.",
            "Grant consent for the client at the provider.", kOpenIDConnect),
        Row("account_selection_required", "The user has several accounts at the provider and must select one.",
            "Sign out of the other accounts, then sign in again.", kOpenIDConnect),
        Row("AADSTS50011", "The redirect URI is not registered for the client.",
            "Register the value of `azure_redirect_uri` at the provider, exactly as it is in the file.", kAzureAD),
        Row("AADSTS500113", "No redirect URI is registered for the client.",
            "Register the value of `azure_redirect_uri` at the provider.", kAzureAD),
        Row("AADSTS50020", "The user's account belongs to another tenant.",
            "Sign in with an account of this tenant, or invite the user as a guest.", kAzureAD),
        Row("AADSTS50034", "The tenant has no such user.",
            "Check the user name. Check that the addresses belong to the user's tenant.", kAzureAD),
        Row("AADSTS50053", "The account is locked after too many attempts.",
            "Wait, or unlock the account at the provider.", kAzureAD),
        Row("AADSTS50055", "The user's password has expired.", "Change the password at the provider.", kAzureAD),
        Row("AADSTS50057", "The user's account is disabled.", "Enable the account at the provider.", kAzureAD),
        Row("AADSTS50058", "The user has no session at the provider.",
            "Sign in at the provider, then sign in here again.", kAzureAD),
        Row("AADSTS50076", "The provider requires a second factor.",
            "Complete it at the provider, then sign in here again.", kAzureAD),
        Row("AADSTS50105", "The user is not assigned to the client.",
            "Assign the user or a group to the client at the provider.", kAzureAD),
        Row("AADSTS50126", "User name or password is wrong.", "Enter them again.", kAzureAD),
        Row("AADSTS50194", "The client is for one tenant, and an address contains `common`.",
            "Replace `common` in the addresses of `azure.conf` by the tenant ID.", kAzureAD),
        Row("AADSTS53003", "A Conditional Access policy blocks the sign-in.",
            "Read the sign-in log at the provider. It names the policy.", kAzureAD),
        Row("AADSTS54005", "The code was already used.", "Sign in again.", kAzureAD),
        Row("AADSTS65001", "Neither the user nor an administrator has consented to this client.",
            "Grant admin consent for the client at the provider.", kAzureAD),
        Row("AADSTS65004", "The user declined consent.",
            "Sign in again and accept, or grant admin consent at the provider.", kAzureAD),
        Row("AADSTS70000", "The code or another part of the request is invalid.",
            "Sign in again. Run `tavosso-doctor`.", kAzureAD),
        Row("AADSTS70008", "The code has expired.", "Sign in again.", kAzureAD),
        Row("AADSTS90002", "The tenant in an address does not exist.",
            "Correct the tenant in the addresses of `azure.conf`.", kAzureAD),
        Row("AADSTS700016", "The tenant has no client with this id.",
            "Compare `azure_client_id` with the application (client) ID. Check the tenant in the addresses.", kAzureAD),
        Row("AADSTS7000215",
            "The client secret is wrong. The ID of the secret may have been copied instead of its value.",
            "Create a new client secret, and set `azure_client_secret` to its value.", kAzureAD),
        Row("AADSTS7000218",
            "The request has no client secret: `azure_client_secret` is empty, or the client is registered as a public "
            "one.",
            R"(Set `azure_client_secret`. Register the redirect URI for the platform "Web".)", kAzureAD),
        Row("AADSTS7000222", "The client secret has expired.",
            "Create a new client secret, and set `azure_client_secret` to its value.", kAzureAD),
        Row("AADSTS9002313", "A part of the request is malformed.",
            "Run `tavosso-doctor`. Check the values in `azure.conf`.", kAzureAD),
    };
    return errors;
}

bool ContainsCode(const std::string &text, const std::string &code) {
    const std::size_t begin = boost::to_lower_copy(text).find(boost::to_lower_copy(code));
    if (begin == std::string::npos) {
        return false;
    }
    const std::size_t end = begin + code.size();
    return (begin == 0 || !IsWordCharacter(text[begin - 1])) && (end == text.size() || !IsWordCharacter(text[end]));
}

const TAVO::Web::FailureRow *FindProviderError(const std::string &text) {
    // The codes of Azure AD are last. They accompany one of OAuth 2.0.
    const std::vector<TAVO::Web::FailureRow> &errors = ProviderErrors();
    const auto error = std::find_if(errors.rbegin(), errors.rend(), [&](const TAVO::Web::FailureRow &row) {
        return ContainsCode(text, row.texts.front());
    });
    return error != errors.rend() ? &*error : nullptr;
}

std::string ReasonOfSentence(const std::string &sentence) {
    const std::pair<const char *, const char *> reasons[] = {
        {"The sign-in was cancelled, or your organisation does not allow you to use this device.", "access_denied"},
        {"Your organisation does not accept this device. Contact your administrator.", "invalid_client"},
        {"Too many users are signed in on this device. Try again later.", "Too many users are signed in."},
    };
    for (const auto &[shown, reason] : reasons) {
        if (boost::iequals(boost::trim_copy(sentence), shown)) {
            return reason;
        }
    }
    return "";
}

}  // namespace Doctor
