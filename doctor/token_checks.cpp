// An ID token, step by step as the library verifies it.
#include <jwt/jwt.h>
#include <openssl/evp.h>
#include <sso/base64.h>

#include <algorithm>
#include <boost/algorithm/string/predicate.hpp>
#include <cstdlib>
#include <ctime>
#include <iterator>
#include <vector>

#include "doctor/checks.h"
#include "doctor/key_set.h"
#include "doctor/watch.h"
#include "web/text.h"

namespace Doctor {

namespace {

/// The steps, by what the library says when it stops there.
struct Stop {
    const char *text;
    const char *id;
};

const Stop kStops[] = {
    {"token cannot be empty", "token.form"},
    {"bad jwt format!", "token.form"},
    {"bad jwt header format!", "token.header"},
    {"bad jwt body format!", "token.claims"},
    {"id_token expired.", "token.expiry"},
    {"tenant ID invalid", "token.tenant"},
    {"client ID invalid", "token.audience"},
    {"kid does not exist in Azure verified kyes", "token.key"},
    {"RSA public 'n' cannot be found!", "token.key_numbers"},
    {"RSA public 'e' cannot be found!", "token.key_numbers"},
    {"encode base64 failed.", "token.secret"},
    {"verify rsa signature failed", "token.signature"},
    {"verify hmac signature failed", "token.signature"},
    {"cannot find the user name!", "token.user_name"},
    {"cannot get the user name!", "token.user_name"},
    {"TAVOWinsUserNameFqdn2Netbios failed.", "token.domain"},
};
constexpr char kNoAlgorithm[] = " algorithm is not supported";  // behind the algorithm's name
constexpr char kEmptyPart[] = "empty jwt part";                 // of header or claims

/// A member as the library compares it: a text, or what a number or boolean reads as.
std::string TextOfMember(const Json::Value &object, const char *name) {
    if (!object.isObject()) {
        return {};
    }
    const Json::Value &member = object[name];
    return member.isArray() || member.isObject() ? "" : member.asString();
}

std::string Describe(const Json::Value &object, const char *name) {
    if (!object.isObject() || !object.isMember(name)) {
        return "missing";
    }
    return TAVO::Web::WriteCompact(object[name]);
}

/// The text of what the library's own verification throws; empty where it passes, or may not fetch what it needs.
std::string Ask(Client &client, const std::string &token, bool mayFetch) {
    if (client.Azure() != nullptr) {
        client.Azure()->mayFetch = mayFetch;
    }
    Json::Value response;
    response["id_token"] = token;
    try {
        client->ProcessTokenResponse(TAVO::Web::WriteCompact(response));
        client->VerifyIDToken();
        std::string userName;
        client->GetUserName(userName);
        return {};
    } catch (const not_fetched &) {
        return {};
    } catch (const std::exception &failure) {
        return TextOf(failure);
    }
}

class TokenCheck {
  public:
    TokenCheck(Report &report, Client &client, const std::string &token, bool mayFetch)
        : report_(report), client_(client), token_(token), mayFetch_(mayFetch) {}

    std::string Run() {
        verdict_ = Ask(client_, token_, mayFetch_);
        for (const std::string &line : TakeLogLines()) {
            report_.Detail("log: " + line);
        }
        if (!CheckForm()) {
            return stop_;
        }
        CheckExpiry();
        if (client_.Azure() != nullptr) {
            Compare("token.tenant", "tenant: \"tid\"", "tid", client_.Azure()->GetTenantID(), "azure_tenant_id",
                    "the user belongs to another organisation, or azure_tenant_id is wrong");
        }
        Compare("token.audience", "audience: \"aud\"", "aud", client_->GetClientID(),
                NameOf(client_.profile()) + "_client_id",
                "the token was made for another client, the provider gives a list, or the client's id is wrong");
        if (client_.Azure() != nullptr) {
            CheckRSASignature();
        } else {
            CheckHMACSignature();
        }
        CheckUserName();
        return stop_;
    }

  private:
    /// One step. The library's own word stands at the one where it stops.
    void Step(const std::string &id, const std::string &subject, bool isGood, const std::string &found,
              const std::string &remedy) {
        Check check{id, subject, isGood ? Mark::kGood : Mark::kFinding, found, isGood ? "" : remedy, ""};
        if (stop_.empty() && id == StopOf(verdict_)) {
            stop_ = id;
            check.library = verdict_;
            check.mark = Mark::kFinding;
        }
        report_.Add(check);
    }

    std::string StopOf(const std::string &text) const {
        if (text == kEmptyPart) {
            return isHeaderGood_ ? "token.claims" : "token.header";
        }
        if (boost::ends_with(text, kNoAlgorithm)) {
            return "token.algorithm";
        }
        const auto *stop =
            std::find_if(std::begin(kStops), std::end(kStops), [&](const Stop &other) { return text == other.text; });
        return stop != std::end(kStops) ? stop->id : "";
    }

    bool CheckForm() {
        const auto dots = std::count(token_.begin(), token_.end(), '.');
        const bool hasForm = dots == 2;
        Step("token.form", "form", hasForm,
             token_.empty() ? "there is no token"
                            : "parts: " + std::to_string(dots + 1) + ", bytes: " + std::to_string(token_.size()),
             "an ID token has three parts with a dot between them (RFC 7515): is this the \"id_token\" of the "
             "provider's answer, and the whole of it?");
        return hasForm && ReadPart("token.header", "header", &TAVO::JWT::Jwt::GetHeader, header_) &&
               ReadPart("token.claims", "claims", &TAVO::JWT::Jwt::GetBody, claims_);
    }

    bool ReadPart(const std::string &id, const std::string &subject, Json::Value (TAVO::JWT::Jwt::*get)(),
                  Json::Value &part) {
        const std::string remedy = "the provider's \"id_token\" is no ID token, or a part of it is lost";
        try {
            TAVO::JWT::Jwt jwt(token_);
            part = (jwt.*get)();
        } catch (const std::exception &failure) {
            Step(id, subject, false, failure.what(), remedy);
            return false;
        }
        isHeaderGood_ = true;
        Step(id, subject, true, "JSON, members: " + std::to_string(part.isObject() ? part.size() : 0), remedy);
        return true;
    }

    void CheckExpiry() {
        const std::time_t now = std::time(nullptr);
        const std::time_t expiry = std::strtol(TextOfMember(claims_, "exp").c_str(), nullptr, 10);
        const bool isGood = now <= expiry;
        constexpr char kFormat[] = "%F %T UTC";
        const std::string end = expiry == 0 ? "" : (isGood ? ", until " : ", expired ") + TimeText(expiry, kFormat);
        Step("token.expiry", "lifetime: \"exp\"", isGood,
             Describe(claims_, "exp") + end + "; it is " + TimeText(now, kFormat),
             "is the clock of this machine right (timedatectl)? an old token is no sign of anything else");
    }

    void Compare(const std::string &id, const std::string &subject, const char *claim, const std::string &configured,
                 const std::string &key, const std::string &remedy) {
        const bool isEqual = TextOfMember(claims_, claim) == configured && !IsList(claims_, claim);
        Step(id, subject, isEqual, Describe(claims_, claim) + "; " + key + " is " + Quoted(configured), remedy);
    }

    static bool IsList(const Json::Value &object, const char *name) {
        return object.isObject() && (object[name].isArray() || object[name].isObject());
    }

    /// Gives the digest, null where the client does not support the algorithm.
    const EVP_MD *CheckAlgorithm() {
        const std::string name = TextOfMember(header_, "alg");
        const std::vector<std::string> supported = AlgorithmsOf(client_.profile());
        const bool isSupported = std::find(supported.begin(), supported.end(), name) != supported.end();
        Step("token.algorithm", "algorithm: \"alg\"", isSupported,
             Describe(header_, "alg") +
                 (isSupported ? ""
                              : "; this profile takes " + supported[0] + ", " + supported[1] + " and " + supported[2]),
             "let the provider sign this client's tokens with " + supported[0]);
        return isSupported ? EVP_get_digestbyname(("SHA" + name.substr(2)).c_str()) : nullptr;  // RS256 uses SHA256
    }

    void CheckRSASignature() {
        if (!mayFetch_) {
            CheckAlgorithm();
            report_.NotChecked("token.key", "key: \"kid\"", Describe(header_, "kid") + "; --fetch asks for the keys");
            report_.NotChecked("token.signature", "signature", "--fetch asks for the keys");
            return;
        }
        const Json::Value key = FindKey();
        if (key.isNull()) {
            CheckAlgorithm();
            report_.NotChecked("token.signature", "signature", "there is no key for it");
            return;
        }
        std::string n = TAVO::Web::StringMember(key, "n");
        std::string e = TAVO::Web::StringMember(key, "e");
        const bool hasNumbers = key["n"].isString() && key["e"].isString();
        Step("token.key_numbers", "numbers of the key", hasNumbers,
             hasNumbers ? std::to_string(SizeOf(key)) + " bits" : R"(it lacks "n" or "e")",
             "the provider's key is no RSA key: let the provider sign with one");
        const EVP_MD *digest = CheckAlgorithm();
        CheckSignature(
            hasNumbers && digest != nullptr, [&](TAVO::JWT::Jwt &jwt) { jwt.JwtRSAVerify(n, e, digest); },
            "does azure_wellknown belong to the provider that made the token? or was the token changed?");
    }

    /// The key that the token names, null where there is none.
    Json::Value FindKey() {
        Json::Value discovery;
        Json::Value keySet;
        client_->RequestWellknownInfo(discovery);
        client_.Azure()->RequestKeysInfo(TextOfMember(discovery, "jwks_uri"), keySet);
        std::string found = Describe(header_, "kid") + TakeMessages();
        Json::Value named;
        const Json::Value keys = keySet.isObject() ? keySet["keys"] : Json::Value();
        if (keys.isArray() && !IsList(header_, "kid")) {
            const auto key = std::find_if(keys.begin(), keys.end(), [&](const Json::Value &other) {
                return other.isObject() && other.isMember("kid") && !IsList(other, "kid") &&
                       TextOfMember(other, "kid") == TextOfMember(header_, "kid");
            });
            named = key != keys.end() ? *key : Json::Value();
        }
        found += named.isNull() ? "; among " + std::to_string(keys.isArray() ? keys.size() : 0) +
                                      " keys of the provider none has it"
                                : "; the provider has published it";
        Step("token.key", "key: \"kid\"", !named.isNull(), found,
             "run tavosso-doctor: can discovery document and key set be fetched? does azure_wellknown belong to the "
             "provider that made the token?");
        return named;
    }

    void CheckHMACSignature() {
        const EVP_MD *digest = CheckAlgorithm();
        const std::string secret = client_->GetClientSecret();
        Step("token.secret", "client secret", !secret.empty() && secret.size() <= TAVO::SSO::kLongestSecret,
             std::to_string(secret.size()) + " bytes",
             "set websphere_client_secret: 1 to " + std::to_string(TAVO::SSO::kLongestSecret) + " bytes");
        std::string key = EncodeBase64(secret);
        CheckSignature(
            digest != nullptr && !secret.empty(), [&](TAVO::JWT::Jwt &jwt) { jwt.JwtHMACVerify(key, digest); },
            "another client secret than the provider's is set, or the token was changed");
    }

    static std::string EncodeBase64(const std::string &bytes) {
        std::string text(4 * ((bytes.size() + 2) / 3), '\0');
        EVP_EncodeBlock(reinterpret_cast<unsigned char *>(text.data()),
                        reinterpret_cast<const unsigned char *>(bytes.data()), static_cast<int>(bytes.size()));
        return text;
    }

    template <typename Verify>
    void CheckSignature(bool canVerify, Verify verify, const std::string &remedy) {
        if (!canVerify) {
            Step("token.signature", "signature", false, "cannot be verified, for what stands above", remedy);
            return;
        }
        bool isGood = true;
        try {
            TAVO::JWT::Jwt jwt(token_);
            verify(jwt);
        } catch (const std::exception &) {
            isGood = false;
        }
        TakeLogLines();
        Step("token.signature", "signature", isGood, isGood ? "is the key's" : "is not the key's", remedy);
    }

    void CheckUserName() {
        const bool isAzure = client_.Azure() != nullptr;
        const Json::Value &claims = claims_;  // a look at one that can be changed would put what is missing into it
        const char *claim = !isAzure                                                ? "sub"
                            : claims.isObject() && claims["unique_name"].isString() ? "unique_name"
                                                                                    : "email";
        const std::string name = TAVO::Web::StringMember(claims, claim);
        const bool isText = claims.isObject() && claims[claim].isString();
        const bool hasForm = isText && (!isAzure || std::count(name.begin(), name.end(), '@') == 1);
        Step("token.user_name", "user name: \"" + std::string(claim) + "\"", hasForm, Describe(claims_, claim),
             isAzure ? R"(the provider has to send "unique_name" or "email" in the form user@domain)"
                     : "the provider has to send \"sub\" as a text");
        if (hasForm) {
            CheckDomain(isAzure);
        }
    }

    void CheckDomain(bool isAzure) {
        bool isGood = true;
        std::string found;
        try {
            std::string userName;
            client_->GetUserName(userName);
            found = "signs in as " + Quoted(userName);
        } catch (const std::exception &failure) {
            isGood = false;
            found = "is not known here";
        }
        Step("token.domain", isAzure ? "domain of the user" : "user", isGood, found + TakeMessages(),
             "join the domain, or write it into /usr/tavo/etc/domains.conf");
    }

    Report &report_;
    Client &client_;
    const std::string &token_;
    bool mayFetch_;
    std::string verdict_;
    std::string stop_;
    bool isHeaderGood_ = false;
    Json::Value header_;
    Json::Value claims_;
};

/// The whole of it, and what nobody else may have of it: what it says, and what proves it.
void HideToken(Report &report, const std::string &token) {
    report.Hide(token);
    const std::size_t claims = token.find('.') + 1;
    const std::size_t signature = token.rfind('.') + 1;
    if (claims < signature) {
        report.Hide(token.substr(claims, signature - claims - 1));
        report.Hide(token.substr(signature));
    }
}

}  // namespace

std::string CheckToken(Report &report, Client &client, const std::string &token, bool mayFetch) {
    report.Section("ID token (" + NameOf(client.profile()) + ")");
    HideToken(report, token);
    return TokenCheck(report, client, token, mayFetch).Run();
}

}  // namespace Doctor
