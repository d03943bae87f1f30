// guide_request.h: what the programs share.
#include <tavosso/sso.h>

#include <cstdlib>
#include <iostream>
#include <string>

/// The text between `name` and the next `end`, empty where there is none.
inline std::string Between(const std::string &text, const std::string &name, char end) {
    const std::size_t begin = text.find(name);
    return begin == std::string::npos
               ? std::string()
               : text.substr(begin + name.size(), text.find(end, begin + name.size()) - begin - name.size());
}

inline std::string Variable(const char *name) {
    const char *value = std::getenv(name);
    return value != nullptr ? value : "";
}

inline std::string Parameter(const std::string &name) {
    const std::string encoded = Between("&" + Variable("QUERY_STRING"), "&" + name + "=", '&');
    std::string value;
    for (std::size_t i = 0; i < encoded.size(); ++i) {
        const bool isEscape = encoded[i] == '%' && i + 2 < encoded.size();
        value += isEscape ? static_cast<char>(std::strtol(encoded.substr(i + 1, 2).c_str(), nullptr, 16)) : encoded[i];
        i += isEscape ? 2 : 0;
    }
    return value;
}

inline std::string Cookie(const std::string &name) {
    return Between("; " + Variable("HTTP_COOKIE"), "; " + name + "=", ';');
}

/// Runs `use` on the client of the profile in force, and refuses what OIDCLogin refuses.
template <typename Use>
void WithClient(Use use) {
    TAVO::SSO::SSOProfile profile;
    if (!profile.SSOIsEnable()) {
        throw TAVO::SSO::sso_op_failed("sso does not enable.");
    }
    if (profile.GetSSOProfile() == "azure") {
        TAVO::SSO::AzureSSOClient client;
        use(client);
    } else if (profile.GetSSOProfile() == "websphere") {
        TAVO::SSO::WebSphereSSOClient client;
        use(client);
    } else {
        throw TAVO::SSO::sso_exception("profile not support.");
    }
}

/// Ends the answer. With its status: a web server may answer a bare path itself, and the fragment would be lost.
inline void GoToRelayPage(const std::string &relayURL) {
    std::cout << "Status: 302 Found\nLocation: /webman/" + relayURL + "\n\n";
}

/// Ends the answer. A text that is JSON is the provider's whole answer, with tokens in it: it goes nowhere.
inline void Fail(const std::string &text) {
    const bool isAnswer = !text.empty() && text[0] == '{';
    const std::string reason = TAVO::SSO::URLEncode(isAnswer ? "The provider refused: unknown error" : text);
    GoToRelayPage(TAVO::SSO::GetSSORelayURL(false, "", reason));
}
