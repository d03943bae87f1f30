// Verification of an Azure ID token. Input lines: the discovery document, the key set and the token. An input is
// accepted if the token is trusted.
#include <stdexcept>

#include "jwt/jwt.h"
#include "sso/sso.h"
#include "tests/fuzz/oracle.h"
#include "tests/fuzz/target.h"
#include "tests/fuzz/token_oracle.h"
#include "tests/support/interposed/clock.h"
#include "tests/support/interposed/transport.h"

namespace Fuzz {

namespace {

constexpr char kTenantID[] = "tenant-of-this-company";
constexpr char kClientID[] = "client-of-this-appliance";
constexpr char kClientSecret[] = "secret-of-this-appliance";
constexpr char kDiscovery[] = "https://login.example.com/discovery";
constexpr char kKeys[] = "https://login.example.com/keys";

constexpr char kNotJson[] = "bad wellknown json format.";

struct Client : TAVO::SSO::AzureSSOClient {
    explicit Client(const std::string &idToken) {
        tenantID = kTenantID;
        clientID = kClientID;
        clientSecret = kClientSecret;
        wellknownEndpoint = kDiscovery;
        token = idToken;
    }
};

/// The expected verification, requests and log lines.
class Expected {
  public:
    Expected(const std::string &discovery, const std::string &keys) : discovery_(discovery), keys_(keys) {}

    void Verify(const std::string &idToken) {
        certain = IsCertain(idToken);
        const ExpectedToken token(idToken);
        token.CheckExpiry();
        token.CheckMember("tid", kTenantID, "tenant ID invalid");
        token.CheckMember("aud", kClientID, "client ID invalid");
        const Json::Value key = FindKey(Fetch(), TextMember(token.header, "kid"));
        const auto n = StringMember(key, "n");
        Throw(!n, "RSA public 'n' cannot be found!");
        const auto e = StringMember(key, "e");
        Throw(!e, "RSA public 'e' cannot be found!");
        VerifySignature(token, *n, *e);
    }

    bool certain = true;
    std::vector<std::string> urls;
    std::vector<std::string> log;

  private:
    static void Throw(bool condition, const char *text) {
        if (condition) {
            throw std::invalid_argument(text);
        }
    }

    Json::Value Fetch() {
        urls.push_back(kDiscovery);
        const std::optional<Json::Value> discovery = ParseJson(UpToNUL(discovery_));
        if (!discovery) {
            log.push_back(std::string("sso:N ") + kNotJson);
        }
        urls.push_back(UpToNUL(TextMember(discovery.value_or(Json::Value()), "jwks_uri").value_or("")));
        if (urls.back() != kKeys && urls.back() != kDiscovery) {
            log.push_back(std::string("azuresso:N request wellknown uri ") + Test::kNotConnected + ".");
            return {};
        }
        return ReadKeys(urls.back() == kKeys ? keys_ : discovery_);
    }

    Json::Value ReadKeys(const std::string &document) {
        const std::optional<Json::Value> keys = ParseJson(UpToNUL(document));
        if (!keys) {
            log.push_back(std::string("azuresso:N request wellknown uri ") + kNotJson + ".");
            return {};
        }
        if (Member(*keys, "keys") == nullptr) {
            log.push_back("azuresso:N no kyes information");
            return {};
        }
        return *Member(*keys, "keys");
    }

    static Json::Value FindKey(const Json::Value &keys, const std::optional<std::string> &kid) {
        for (Json::ArrayIndex i = 0; keys.isArray() && i < keys.size(); ++i) {
            if (kid && Member(keys[i], "kid") != nullptr && TextMember(keys[i], "kid") == kid) {
                return keys[i];
            }
        }
        throw std::invalid_argument("kid does not exist in Azure verified kyes");
    }

    void VerifySignature(const ExpectedToken &token, const std::string &n, const std::string &e) {
        const EVP_MD *digest = token.ChooseDigest("RS");
        const Decoded modulus = DecodeBase64(n);
        const Decoded exponent = DecodeBase64(e);
        const Decoded signature = DecodeBase64(token.signature);
        certain = certain && modulus.wellFormed && exponent.wellFormed && signature.wellFormed;
        if (modulus.bytes.empty() || exponent.bytes.empty() || signature.bytes.empty() ||
            !RSAVerifies(modulus.bytes, exponent.bytes, signature.bytes, token.signingInput, digest)) {
            throw TAVO::JWT::jwt_verify_failed("verify rsa signature failed");
        }
    }

    std::string discovery_;
    std::string keys_;
};

std::vector<Test::Failure> Reasons() {
    std::vector<Test::Failure> reasons = {Test::Fails<TAVO::JWT::jwt_verify_failed>("verify rsa signature failed")};
    for (const char *text : {"tenant ID invalid", "kid does not exist in Azure verified kyes",
                             "RSA public 'n' cannot be found!", "RSA public 'e' cannot be found!"}) {
        reasons.push_back(Test::Fails<std::invalid_argument>(text));
    }
    return reasons;
}

bool IsVerificationLine(const Test::LogLine &line) {
    return line == Test::Error("jwt:N EVP_DigestVerifyInit failed") ||
           line == Test::Error("jwt:N EVP_DigestVerifyFinal failed");
}

/// Requires the log lines of the two requests, and at most one line of a wrong signature after them.
void RequireExpectedLog(std::vector<Test::LogLine> log, const std::vector<std::string> &expected,
                        const Test::Failure &failure) {
    const bool isWrong = failure.type == typeid(TAVO::JWT::jwt_verify_failed).name();
    if (isWrong && log.size() == expected.size() + 1 && IsVerificationLine(log.back())) {
        log.pop_back();
    }
    std::vector<Test::LogLine> lines;
    for (const std::string &text : expected) {
        lines.push_back(Test::Error(text));
    }
    Require(log == lines, "unexpected log lines");
}

void RequireVerifiedPeers() {
    for (const std::string &call : Test::CurrentTransport().calls) {
        // Only at the beginning: a URL from the provider may contain the name.
        Require(call.rfind("curl_easy_setopt CURLOPT_SSL_VERIFY", 0) != 0, "certificate verification is disabled");
    }
}

}  // namespace

bool Accepts(const std::string &input) {
    const std::vector<std::string> lines = Lines(input, 3);
    const std::string &token = lines[2];
    Test::SetClock(kNow);
    Test::ResetTransport();
    Test::CurrentTransport().answers = {{kDiscovery, Test::Whole(lines[0])}, {kKeys, Test::Whole(lines[1])}};
    Client client(token);
    const Test::Failure failure = FailureOf([&] { client.VerifyIDToken(); });

    Expected expected(lines[0], lines[1]);
    const Test::Failure expectedFailure = Test::FailureOf([&] { expected.Verify(token); });
    RequireVerdict(failure, expectedFailure, expected.certain, Reasons());
    RequireVerifiedPeers();
    const std::vector<Test::LogLine> log = Test::TakeSystemLog();
    RequireNotIn(log, {kClientSecret, token});
    if (expected.certain) {
        Require(Test::CurrentTransport().urls == expected.urls, "unexpected requests");
        RequireExpectedLog(log, expected.log, failure);
    }
    Require(client.GetToken() == token, "the client has changed");
    return failure == Test::kNothingThrown;
}

}  // namespace Fuzz
