// An ID token: the steps of the library's verification, and the token's values.
#include <jwt/jwt.h>
#include <sso/limits.h>

#include <algorithm>
#include <boost/algorithm/string/case_conv.hpp>
#include <boost/algorithm/string/join.hpp>
#include <cstdlib>
#include <ctime>
#include <initializer_list>
#include <new>
#include <stdexcept>
#include <vector>

#include "doctor/checks.h"
#include "doctor/explain.h"
#include "doctor/guid.h"
#include "doctor/watch.h"
#include "web/failure_lookup.h"
#include "web/text.h"

namespace Doctor {

namespace {

std::string Describe(const Json::Value &object, const std::string &name) {
    return object.isObject() && object.isMember(name) ? TAVO::Web::WriteCompact(object[name]) : "missing";
}

std::string DescribeExpiry(const Json::Value &claims) {
    constexpr char kFormat[] = "%F %T UTC";
    const std::string text = Describe(claims, "exp");
    const std::time_t expiry = std::strtol(text.c_str() + (text.front() == '"' ? 1 : 0), nullptr, 10);
    return text + (expiry == 0 ? "" : ", " + TimeText(expiry, kFormat)) + "; it is " +
           TimeText(std::time(nullptr), kFormat);
}

std::string RemedyOf(const std::string &text) {
    for (const Explanation &explanation : LookUp(text)) {
        if (explanation.failure->kind == TAVO::Web::FailureKind::kException) {
            return WithoutBackticks(explanation.failure->remedy);
        }
    }
    return {};
}

class TokenCheck {
  public:
    TokenCheck(Report &report, Client &client, const std::string &token, bool mayFetch)
        : report_(report), client_(client), token_(token), mayFetch_(mayFetch) {}

    std::string Run() {
        failure_ = Verify();
        for (const std::string &line : TakeLogLines()) {
            report_.Detail("log: " + line);
            log_ += "; " + MessageOf(line);
        }
        CheckSteps();
        if (stop_.empty() && !failure_.empty()) {
            throw std::runtime_error("the token could not be verified: " + failure_);
        }
        return stop_;
    }

  private:
    /// Returns the text of the exception that ends the library's verification; empty if it accepts the token.
    std::string Verify() {
        if (client_.Azure() != nullptr) {
            client_.Azure()->mayFetch = mayFetch_;
        }
        Json::Value response;
        response["id_token"] = token_;
        try {
            client_->ProcessTokenResponse(TAVO::Web::WriteCompact(response));
            try {
                client_->VerifyIDToken();
            } catch (const not_fetched &) {
                // The name does not need the keys.
            }
            client_->GetUserName(userName_);
            return {};
        } catch (const std::bad_alloc &) {
            throw;  // no verdict
        } catch (const std::exception &failure) {
            return TextOf(failure);
        }
    }

    /// Reports a step of the library's verification, which fails with one of these texts of the failure table.
    void Step(const std::string &id, const std::string &subject, std::initializer_list<const char *> stops,
              const std::string &found, bool needsKeys = false) {
        if (!stop_.empty()) {
            report_.NotChecked(id, subject, "the library stops before it");
        } else if (std::any_of(stops.begin(), stops.end(),
                               [&](const char *text) { return TAVO::Web::IsText(failure_, text); })) {
            stop_ = id;
            report_.Add({id, subject, Mark::kFinding,
                         found + log_ + (id == "token.key" && log_.empty() ? PublishedKeys() : ""), RemedyFor(id),
                         failure_});
        } else if (needsKeys && !mayFetch_) {
            report_.NotChecked(id, subject, found + "; --fetch fetches the provider's keys");
        } else {
            report_.Good(id, subject, found);
        }
    }

    /// Whether the profile's client can verify the token's signature.
    bool IsAlgorithmSupported() const {
        const std::vector<std::string> algorithms = AlgorithmsOf(client_.profile());
        return std::find(algorithms.begin(), algorithms.end(), TAVO::Web::StringMember(header_, "alg")) !=
               algorithms.end();
    }

    /// The remedy for this token's values, or the general one of the failure.
    std::string RemedyFor(const std::string &id) const {
        const std::string tenant = TAVO::Web::StringMember(claims_, "tid");
        if (id == "token.tenant" && IsGUID(tenant)) {
            return "If the users belong to this tenant, set azure_tenant_id to " + Quoted(tenant);
        }
        if (id == "token.audience" && claims_.isObject() && claims_["aud"].isArray()) {
            return "Configure the provider to send the client id alone as audience, not a list.";
        }
        if (id == "token.key" && !IsAlgorithmSupported()) {
            return "Configure the provider to sign the tokens of this client with " +
                   AlgorithmsOf(client_.profile()).front() + '.';
        }
        if (id == "token.domain") {
            return RemedyForDomain(boost::to_lower_copy(userName_.substr(0, userName_.find('\\'))));
        }
        return RemedyOf(failure_);
    }

    void Compare(const std::string &id, const std::string &claim, const char *stop, const std::string &key,
                 const std::string &configured) {
        Step(id, "claim: " + Quoted(claim), {stop},
             Describe(claims_, claim) + "; " + key + " is " + Quoted(configured));
    }

    void CheckSteps() {
        const bool isAzure = client_.Azure() != nullptr;
        const auto dots = std::count(token_.begin(), token_.end(), '.');
        Step("token.form", "form", {"token cannot be empty", "bad jwt format!"},
             "parts: " + std::to_string(dots + 1) + ", bytes: " + std::to_string(token_.size()));
        CheckPart("token.header", "header", &TAVO::JWT::Jwt::GetHeader, "bad jwt header format!", header_);
        CheckPart("token.claims", "claims", &TAVO::JWT::Jwt::GetBody, "bad jwt body format!", claims_);
        Step("token.expiry", "lifetime: \"exp\"", {"id_token expired."}, DescribeExpiry(claims_));
        if (isAzure) {
            Compare("token.tenant", "tid", "tenant ID invalid", "azure_tenant_id", client_.Azure()->GetTenantID());
        }
        Compare("token.audience", "aud", "client ID invalid", NameOf(client_.profile()) + "_client_id",
                MayPrintClientID(client_) ? client_->GetClientID() : "[hidden]");
        const std::string kid = Describe(header_, "kid");
        if (isAzure) {
            Step("token.key", "key: \"kid\"", {"kid does not exist in Azure verified kyes"},
                 kid + (IsAlgorithmSupported() ? "" : R"(; "alg" is )" + Describe(header_, "alg")), true);
            Step("token.key_numbers", "numbers of the key",
                 {"RSA public 'n' cannot be found!", "RSA public 'e' cannot be found!"}, R"("n" and "e" of )" + kid,
                 true);
        }
        Step("token.algorithm", "algorithm: \"alg\"", {"ALG algorithm is not supported"},
             Describe(header_, "alg") + "; supported: " + boost::join(AlgorithmsOf(client_.profile()), ", "), isAzure);
        const std::string secret = "secret of " + std::to_string(client_->GetClientSecret().size()) + " bytes";
        if (!isAzure) {
            Step("token.secret", "client secret", {"encode base64 failed."},
                 secret + ", at most " + std::to_string(TAVO::SSO::kLongestSecret));
        }
        Step("token.signature", "signature", {"verify rsa signature failed", "verify hmac signature failed"},
             "by the " + (isAzure ? "key " + kid : secret), isAzure);
        CheckUser(isAzure);
    }

    void CheckPart(const std::string &id, const std::string &subject, Json::Value (TAVO::JWT::Jwt::*get)(),
                   const char *stop, Json::Value &part) {
        std::string found = "not JSON";
        const char *emptyPart = stop;
        try {
            part = (TAVO::JWT::Jwt(token_).*get)();
            found = "JSON, members: " + std::to_string(part.isObject() ? part.size() : 0);
        } catch (const std::exception &) {
            emptyPart = "empty jwt part";
        }
        Step(id, subject, {stop, emptyPart}, found);
    }

    void CheckUser(bool isAzure) {
        const Json::Value &claims = claims_;  // operator[] of a mutable value would add the member
        const char *claim = !isAzure                                                ? "sub"
                            : claims.isObject() && claims["unique_name"].isString() ? "unique_name"
                                                                                    : "email";
        Step("token.user_name", "user name: " + Quoted(claim),
             {"cannot find the user name!", "cannot get the user name!"},
             Describe(claims, claim) +
                 (claims.isObject() && claims.isMember("unique_name") && claim == std::string("email")
                      ? R"(; "unique_name" is not a string: )" + Describe(claims, "unique_name")
                      : ""));
        // After a failure, userName_ is the name before the conversion.
        Step("token.domain", isAzure ? "domain of the user" : "user", {"TAVOWinsUserNameFqdn2Netbios failed."},
             (stop_.empty() && failure_.empty() ? "signs in as " : "") + Quoted(userName_));
        if (stop_.empty() && failure_.empty()) {
            report_.Result("The user signs in as " + Quoted(userName_) + ".");
        }
    }

    std::string PublishedKeys() {
        Json::Value discovery;
        Json::Value keySet;
        client_->RequestWellknownInfo(discovery);
        client_.Azure()->RequestKeysInfo(TAVO::Web::StringMember(discovery, "jwks_uri"), keySet);
        std::vector<std::string> kids;
        for (const Json::Value &key : keySet.isObject() ? keySet["keys"] : Json::Value()) {
            kids.push_back(Describe(key, "kid"));
        }
        return "; the provider publishes " + (kids.empty() ? "none" : boost::join(kids, ", ")) + TakeMessages();
    }

    Report &report_;
    Client &client_;
    const std::string &token_;
    bool mayFetch_;
    std::string failure_;  // the text of the library's exception
    std::string stop_;
    std::string log_;
    std::string userName_;
    Json::Value header_;
    Json::Value claims_;
};

/// Hides the token, and its claims and its signature alone.
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
