#include "tests/faults/scenario.h"

#include <cxxabi.h>
#include <openssl/evp.h>

#include <cstdlib>
#include <iomanip>
#include <ostream>
#include <regex>
#include <sstream>

#include "sso/sso.h"
#include "tests/support/files.h"
#include "tests/support/token.h"

namespace Test {

namespace {

constexpr char kAzureEndpoints[] = R"({"azure_authorization_endpoint": "https://idp.example/authorize",
                                       "azure_logout_endpoint": "https://idp.example/logout"})";
constexpr char kWebSphereEndpoints[] = R"({"websphere_authorization_endpoint": "https://idp.example/authorize"})";

/// {"origin":"/desk top"}
constexpr char kState[] = "eyJvcmlnaW4iOiIvZGVzayB0b3AifQ==";

Use MakeReady(Profile profile, std::function<void(std::string &)> call) {
    return {std::make_unique<Provider>(profile, profile == Profile::kAzure ? kAzureEndpoints : kWebSphereEndpoints),
            std::move(call)};
}

Use LogIn(Profile profile) {
    static const std::string tokens[] = {
        SignedToken(TokenHeader(Profile::kAzure), TokenClaims(Profile::kAzure)),
        SignedToken(TokenHeader(Profile::kWebSphere), TokenClaims(Profile::kWebSphere))};
    Use use = MakeReady(profile, [](std::string &userName) { TAVO::SSO::OIDCLogin("code/1", userName); });
    use.provider->AnswerLogin(tokens[static_cast<int>(profile)]);
    return use;
}

void ReadProfile(std::string &result) {
    TAVO::SSO::SSOProfile profile;
    result = profile.SSOIsEnable() ? "on, " : "off, ";
    result += profile.GetSSOProfile() + ", client '" + profile.GetSSOClient()->GetClientID() + "'";
}

template <typename Client>
void BuildAuthorizationURL(std::string &url) {
    Json::Value state;
    state["origin"] = "/desk top";
    url = Client().GetAccessTokenReqURI(state);
}

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

std::string PercentDecode(const std::string &text) {
    std::string decoded;
    for (std::size_t i = 0; i < text.size(); ++i) {
        if (text[i] == '%') {
            decoded += static_cast<char>(std::stoi(text.substr(i + 1, 2), nullptr, 16));
            i += 2;
        } else {
            decoded += text[i];
        }
    }
    return decoded;
}

std::string Base64Decode(const std::string &text) {
    std::string bytes(text.size(), '\0');
    const int length =
        EVP_DecodeBlock(reinterpret_cast<unsigned char *>(bytes.data()),
                        reinterpret_cast<const unsigned char *>(text.data()), static_cast<int>(text.size()));
    bytes.resize(length < 0 ? 0 : static_cast<std::size_t>(length));
    return bytes.c_str();  // without the zero bytes that padding counts as
}

/// Shows what is inside of the state, and hides what is new in every URL.
std::string Readable(std::string url) {
    std::smatch match;
    if (std::regex_search(url, match, std::regex("&state=([^&]*)"))) {
        Json::Value state = Parse(Base64Decode(PercentDecode(match[1])));
        url = match.prefix().str() + "&state=<" + Compact(state) + ">" + match.suffix().str();
    }
    if (std::regex_search(url, match, std::regex("&nonce=([0-9a-f]{8}-([0-9a-f]{4}-){3}[0-9a-f]{12})&"))) {
        const std::string nonce = match[1];
        url = std::regex_replace(url, std::regex(nonce), "NONCE");
        url = std::regex_replace(url, std::regex(MD5Of(nonce)), "DIGEST");
    }
    return url;
}

std::string ClassOf(const std::exception &error) {
    const std::unique_ptr<char, decltype(&std::free)> name(
        abi::__cxa_demangle(typeid(error).name(), nullptr, nullptr, nullptr), std::free);
    return name.get();
}

}  // namespace

void PrintTo(const Scenario &scenario, std::ostream *stream) { *stream << scenario.name; }

const std::vector<Scenario> &Scenarios() {
    static const std::vector<Scenario> scenarios{
        {"AzureLogin", kUserNameBefore, [] { return LogIn(Profile::kAzure); }},
        {"WebSphereLogin", kUserNameBefore, [] { return LogIn(Profile::kWebSphere); }},
        {"AzureProfile", "", [] { return MakeReady(Profile::kAzure, ReadProfile); }},
        {"WebSphereProfile", "", [] { return MakeReady(Profile::kWebSphere, ReadProfile); }},
        {"AzureAuthorizationURL", "",
         [] { return MakeReady(Profile::kAzure, BuildAuthorizationURL<TAVO::SSO::AzureSSOClient>); }},
        {"WebSphereAuthorizationURL", "",
         [] { return MakeReady(Profile::kWebSphere, BuildAuthorizationURL<TAVO::SSO::WebSphereSSOClient>); }},
        {"RelayURL", "",
         [] {
             return MakeReady(Profile::kAzure,
                              [](std::string &url) { url = TAVO::SSO::GetSSORelayURL(true, kState, ""); });
         }},
        {"LogoutURL", "",
         [] {
             return MakeReady(Profile::kAzure, [](std::string &url) {
                 url = TAVO::SSO::GetAzureSSOLogoutURL("https://nas.example/webman/index.cgi");
             });
         }},
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
        return "throws " + ClassOf(error) + ": " + error.what() + change;
    } catch (...) {
        return "throws something else" + change;
    }
}

}  // namespace Test
