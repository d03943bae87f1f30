// sso.cgi: starts a login, and is the redirect URI that finishes it.
#include <openssl/evp.h>
#include <syslog.h>
#include <tavosso/jwt.h>
#include <tavosso/sso.h>

#include <iostream>
#include <random>
#include <sstream>

std::string Variable(const char *name) {
    const char *value = std::getenv(name);
    return value != nullptr ? value : "";
}

/// A parameter of the query, percent-decoded; empty if there is none.
std::string Parameter(const std::string &name) {
    std::istringstream query(Variable("QUERY_STRING"));
    std::string pair;
    std::string value;
    while (std::getline(query, pair, '&') && pair.rfind(name + "=", 0) != 0) {
        pair.clear();
    }
    for (std::size_t i = name.size() + 1; i < pair.size(); i += pair[i] == '%' ? 3 : 1) {
        value += static_cast<char>(pair[i] == '%' ? std::stoi(pair.substr(i + 1, 2), nullptr, 16) : pair[i]);
    }
    return value;
}

/// The state is base64 of a JSON object.
Json::Value DecodeState(const std::string &state) {
    std::string json(state.size(), ' ');
    EVP_DecodeBlock(reinterpret_cast<unsigned char *>(json.data()),
                    reinterpret_cast<const unsigned char *>(state.data()), static_cast<int>(state.size()));
    Json::Value object;
    std::istringstream(json) >> object;
    return object;
}

template <typename Client>
void StartLogin(Client &client) {
    Json::Value state;
    state["origin"] = "/index.cgi";
    for (int i = 0; i < 4; ++i) {
        state["login"] = state["login"].asString() + std::to_string(std::random_device()());
    }
    std::cout << "Cache-Control: no-store\nSet-Cookie: __Host-login=" << state["login"].asString()
              << "; Path=/; Secure; HttpOnly; SameSite=Lax; Max-Age=600\n";
    client.RedirectAuthEndpoint(state);
}

void Require(bool isGood) { isGood ? void() : throw std::runtime_error("refused"); }

void FinishLogin(TAVO::SSO::SSOClient &client) {
    const Json::Value state = DecodeState(Parameter("state"));
    const std::string login = state["login"].asString();  // of the browser that started it
    Require(!login.empty() &&
            ("; " + Variable("HTTP_COOKIE") + ";").find("; __Host-login=" + login + ";") != std::string::npos);
    std::string user;
    client.OpenIDConnectLogin(Parameter("code"), user);
    const std::string nonce = TAVO::JWT::Jwt(client.GetToken()).GetBody()["nonce"].asString();
    Require(!nonce.empty() && TAVO::SSO::MD5Digest(nonce) == state["nonce"].asString());
    syslog(LOG_AUTH | LOG_INFO, "signed in: %s", user.c_str());  // Open your session here.
    std::cout << "Status: 302 Found\nLocation: /webman/" << TAVO::SSO::GetSSORelayURL(true, Parameter("state"), "")
              << "\n\n";
}

int main() {
    try {
        TAVO::SSO::SSOProfile profile;
        const std::string name = profile.SSOIsEnable() ? profile.GetSSOProfile() : "";
        const auto serve = [](auto client) { Parameter("state").empty() ? StartLogin(client) : FinishLogin(client); };
        Require(name == "azure" || name == "websphere");
        name == "azure" ? serve(TAVO::SSO::AzureSSOClient()) : serve(TAVO::SSO::WebSphereSSOClient());
    } catch (const std::exception &) {  // Its text may hold the provider's whole answer.
        syslog(LOG_AUTH | LOG_WARNING, "sign-in failed");
        std::cout << "Status: 302 Found\nLocation: /webman/" << TAVO::SSO::GetSSORelayURL(false, "", "sign-in%20failed")
                  << "\n\n";
    }
}
