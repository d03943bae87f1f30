#include "tests/faults/scenario.h"

#include <openssl/evp.h>

#include <iomanip>
#include <ostream>
#include <regex>
#include <sstream>

#include "sso/sso.h"
#include "tests/support/encoding.h"
#include "tests/support/failure.h"
#include "tests/support/files.h"
#include "tests/support/token.h"

namespace Test {

namespace {

constexpr char kAzureEndpoints[] = R"({"azure_authorization_endpoint": "https://idp.example/authorize",
                                       "azure_logout_endpoint": "https://idp.example/logout"})";
constexpr char kWebSphereEndpoints[] = R"({"websphere_authorization_endpoint": "https://idp.example/authorize"})";

/// Values that cannot be encoded are sent verbatim; an unreadable file leaves the settings empty.
constexpr char kAuthorizationURL[] =
    R"re((https://idp\.example/authorize)?\?client_id=(the( |%20)client)?&nonce=NONCE&redirect_uri=(https.*)?)re"
    R"re(&response_type=code&scope=openid( profile email|%20profile%20email)?)re"
    R"re(&state=<\{"nonce":"(DIGEST)?","origin":"/desk top"\}>)re";

/// {"origin":"/desk top"}
constexpr char kState[] = "eyJvcmlnaW4iOiIvZGVzayB0b3AifQ==";

Use Prepare(Profile profile, std::function<void(std::string &)> call) {
    return {std::make_unique<Provider>(profile, profile == Profile::kAzure ? kAzureEndpoints : kWebSphereEndpoints),
            nullptr, std::move(call)};
}

void LogIn(std::string &userName) { TAVO::SSO::OIDCLogin("code/1", userName); }

template <Profile profile>
Use PrepareToLogIn() {
    static const std::string token = SignedToken(TokenHeader(profile), TokenClaims(profile));
    Use use = Prepare(profile, LogIn);
    use.provider->AnswerLogin(token);
    return use;
}

/// Signed with another key or secret.
std::string Forge(Profile profile) {
    static const RSAKey otherKey;
    return profile == Profile::kAzure ? otherKey.RS256Token(TokenClaims(profile), kKeyID)
                                      : HS256Token(TokenClaims(profile), "another secret");
}

Use PrepareToLogInWithoutTLS(Profile profile, const std::string &token) {
    auto server = std::make_unique<Server>();
    Json::Value endpoints;
    endpoints["azure_wellknown"] = server->URL("/discovery");
    endpoints["azure_token_endpoint"] = endpoints["websphere_token_endpoint"] = server->URL("/token");
    server->Answer(HTTPAnswer(TokenResponse(token)));
    server->Answer(HTTPAnswer(R"({"jwks_uri": ")" + server->URL("/keys") + "\"}"));
    server->Answer(HTTPAnswer(KeySet()));
    return {std::make_unique<Provider>(profile, Compact(endpoints)), std::move(server), LogIn};
}

template <Profile profile>
Use PrepareToken() {
    static const std::string token = SignedToken(TokenHeader(profile), TokenClaims(profile));
    return PrepareToLogInWithoutTLS(profile, token);
}

template <Profile profile>
Use PrepareForgery() {
    static const std::string token = Forge(profile);
    return PrepareToLogInWithoutTLS(profile, token);
}

void ReadProfile(std::string &result) {
    TAVO::SSO::SSOProfile profile;
    result = profile.SSOIsEnable() ? "on, " : "off, ";
    result += profile.GetSSOProfile() + ", client '" + profile.GetSSOClient()->GetClientID() + "'";
}

template <typename Client>
void BuildAuthorizationURL(std::string &url) {
    static const Json::Value state = Parse(R"({"origin": "/desk top"})");
    url = Client().GetAccessTokenReqURI(state);
}

void BuildRelayURL(std::string &url) { url = TAVO::SSO::GetSSORelayURL(true, kState, ""); }

void BuildLogoutURL(std::string &url) { url = TAVO::SSO::GetAzureSSOLogoutURL("https://nas.example/webman/index.cgi"); }

std::string MD5Of(const std::string &text) {
    unsigned char digest[EVP_MAX_MD_SIZE];
    unsigned int length = 0;
    EVP_Digest(text.data(), text.size(), digest, &length, EVP_md5(), nullptr);
    std::ostringstream hexadecimal;
    for (unsigned int i = 0; i < length; ++i) {
        hexadecimal << std::hex << std::setw(2) << std::setfill('0') << static_cast<int>(digest[i]);
    }
    return hexadecimal.str();
}

/// Decodes the state and replaces random values.
std::string Readable(std::string url) {
    std::smatch match;
    if (std::regex_search(url, match, std::regex("&state=([^&]*)"))) {
        Json::Value state = Parse(FromBase64(PercentDecode(match[1])));
        url = match.prefix().str() + "&state=<" + Compact(state) + ">" + match.suffix().str();
    }
    if (std::regex_search(url, match, std::regex("&nonce=([0-9a-f]{8}-([0-9a-f]{4}-){3}[0-9a-f]{12})&"))) {
        const std::string nonce = match[1];
        url = std::regex_replace(url, std::regex(nonce), "NONCE");
        url = std::regex_replace(url, std::regex(MD5Of(nonce)), "DIGEST");
    }
    return url;
}

}  // namespace

void PrintTo(const Scenario &scenario, std::ostream *stream) { *stream << scenario.name; }

const std::vector<Scenario> &Scenarios() {
    static const std::vector<Scenario> scenarios{
        {"AzureLogin", kUserNameBefore, R"(CORP\\Alice)", PrepareToLogIn<Profile::kAzure>},
        {"WebSphereLogin", kUserNameBefore, "alice", PrepareToLogIn<Profile::kWebSphere>},
        {"AzureProfile", "", "off, , client ''|on, azure, client '(the client)?'",
         [] { return Prepare(Profile::kAzure, ReadProfile); }},
        {"WebSphereProfile", "", "off, , client ''|on, websphere, client '(the client)?'",
         [] { return Prepare(Profile::kWebSphere, ReadProfile); }},
        {"AzureAuthorizationURL", "", kAuthorizationURL,
         [] { return Prepare(Profile::kAzure, BuildAuthorizationURL<TAVO::SSO::AzureSSOClient>); }},
        {"WebSphereAuthorizationURL", "", kAuthorizationURL,
         [] { return Prepare(Profile::kWebSphere, BuildAuthorizationURL<TAVO::SSO::WebSphereSSOClient>); }},
        {"RelayURL", "", R"(ssoclient/relay\.html#(origin=(%2Fdesk%20|/desk )top&)?success=true)",
         [] { return Prepare(Profile::kAzure, BuildRelayURL); }},
        {"LogoutURL", "",
         R"((https://idp\.example/logout)?\?post_logout_redirect_uri=https(:|%3A).*nas\.example.*relay\.html)",
         [] { return Prepare(Profile::kAzure, BuildLogoutURL); }},
    };
    return scenarios;
}

const std::vector<Scenario> &PlainLogins() {
    static const std::vector<Scenario> scenarios{
        {"PlainAzureLogin", kUserNameBefore, R"(CORP\\Alice)", PrepareToken<Profile::kAzure>},
        {"PlainWebSphereLogin", kUserNameBefore, "alice", PrepareToken<Profile::kWebSphere>},
        {"ForgedAzureLogin", kUserNameBefore, nullptr, PrepareForgery<Profile::kAzure>},
        {"ForgedWebSphereLogin", kUserNameBefore, nullptr, PrepareForgery<Profile::kWebSphere>},
    };
    return scenarios;
}

void Run(const Use &use, Ending &ending) {
    try {
        use.call(ending.result);
    } catch (...) {
        ending.failure = std::current_exception();
    }
}

std::string Describe(const Scenario &scenario, const Ending &ending) {
    if (!ending.failure) {
        return "returns " + Readable(ending.result);
    }
    const std::string change = ending.result == scenario.before ? "" : ", the result is " + ending.result;
    try {
        std::rethrow_exception(ending.failure);
    } catch (const std::exception &error) {
        RequireInTable(error);
        return "throws " + ClassOf(error) + ": " + error.what() + change;
    } catch (...) {
        return "throws something else" + change;
    }
}

}  // namespace Test
