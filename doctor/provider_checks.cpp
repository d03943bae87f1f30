// The provider, through the requests of the library.
#include <algorithm>
#include <boost/algorithm/string/classification.hpp>
#include <boost/algorithm/string/join.hpp>
#include <boost/algorithm/string/predicate.hpp>
#include <boost/algorithm/string/trim.hpp>
#include <vector>

#include "doctor/address.h"
#include "doctor/answer.h"
#include "doctor/azure_checks.h"
#include "doctor/checks.h"
#include "doctor/explain.h"
#include "doctor/key_set.h"
#include "doctor/provider_errors.h"
#include "doctor/transfer_checks.h"
#include "doctor/watch.h"
#include "web/request.h"
#include "web/text.h"

namespace Doctor {

namespace {

constexpr long kSuccess = 200;
constexpr long kUnauthorized = 401;
constexpr long kRefusals = 400;  // and above
constexpr long kNotFound = 404;

// No provider issues these.
constexpr char kTestCode[] = "tavosso-doctor-made-this-up";
constexpr char kTestSecret[] = "tavosso-doctor-made-this-up-too";

constexpr char kWellknownPath[] = "/.well-known/openid-configuration";

constexpr char kWait[] = "Wait until the provider works again. The settings of this machine are not the cause.";

/// The beginning of a remedy for a redirect.
std::string NotFollowed(const Transfer &transfer) {
    return transfer.location.empty() ? "" : "The library does not follow redirects. ";
}

std::size_t Append(char *bytes, std::size_t size, std::size_t count, void *response) {
    static_cast<std::string *>(response)->append(bytes, size * count);
    return size * count;
}

std::string WithoutTrailingSlashes(const std::string &url) {
    return boost::trim_right_copy_if(url, boost::is_any_of("/"));
}

bool IsDiscoveryDocument(const Json::Value &document) {
    return document.isObject() && document["issuer"].isString() && document["jwks_uri"].isString();
}

/// Returns the body of a token request with another client secret.
std::string WithSecret(const std::string &body, const std::string &secret) {
    constexpr char kName[] = "client_secret=";
    const std::size_t begin = body.find(kName) + sizeof kName - 1;
    return body.substr(0, begin) + secret + body.substr(std::min(body.find('&', begin), body.size()));
}

/// Whether an error of the token endpoint is about the code, which the doctor makes up.
bool ConcernsCode(const TAVO::Web::FailureRow &row) {
    const std::string code = row.texts.front();
    return code == "invalid_grant" || code == "invalid_request" || code == "AADSTS54005" || code == "AADSTS70000" ||
           code == "AADSTS70008" || code == "AADSTS9002313";
}

/// Whether an error of the token endpoint is about the client's id or secret, without details.
bool IsOfClient(const TAVO::Web::FailureRow &row) {
    const std::string code = row.texts.front();
    return code == "invalid_client" || code == "unauthorized_client";
}

class ProviderCheck {
  public:
    ProviderCheck(Report &report, Client &client)
        : report_(report), client_(client), prefix_(NameOf(client.profile()) + '_'), transfers_(report) {}

    void Run() {
        report_.Section("Network");
        if (!transfers_.CheckMachine(client_->GetTokenEndpoint())) {
            report_.NotChecked("discovery.reachable", "provider", "no certificate can be verified");
            return;
        }
        if (client_.Azure() != nullptr) {
            CheckDiscovery(Mark::kFinding);
            CheckTenantOfIssuer(report_, client_, Published("issuer"));
            CheckAuthorization();
            CheckKeys();
            CheckTokenEndpoint();
        } else {
            CheckAuthorization();
            CheckTokenEndpoint();
            // Last: a host that does not answer is not asked again, and WebSphere's logins do not use the document.
            CheckDiscovery(Mark::kNote);
        }
    }

  private:
    /// A response as text. The library's own functions return JSON.
    struct Fetched {
        Transfer transfer;
        std::string content;
    };

    Fetched Fetch(const std::string &url) {
        Fetched fetched;
        try {
            TAVO::SSO::httpGet(url, fetched.content, true, Append);
        } catch (const std::exception &) {
            // The transfer has the result.
        }
        fetched.transfer = LastTransfer(report_);
        return fetched;
    }

    /// A document that is only compared with the file is not a finding if it cannot be fetched.
    void CheckDiscovery(Mark mark) {
        report_.Section("Discovery document");
        const std::string subject = mark == Mark::kNote ? "discovery document (unused)" : "discovery document";
        const std::string address = client_->GetWellknownEndpoint();
        if (address.empty()) {
            report_.NotChecked("discovery.reachable", subject, prefix_ + "wellknown is not set");
            return;
        }
        client_->RequestWellknownInfo(discovery_);
        const Transfer transfer = LastTransfer(report_);
        if (!transfers_.Check("discovery", subject, prefix_ + "wellknown", transfer, mark)) {
            return;
        }
        const bool isDocument =
            discovery_.isObject() && (discovery_.isMember("issuer") || discovery_.isMember("jwks_uri") ||
                                      discovery_.isMember("authorization_endpoint"));
        if (!isDocument || transfer.status != kSuccess) {
            report_.Add(
                {"discovery.document", subject, mark,
                 address + " returns no discovery document: " + DescribeAnswer(transfer, Fetch(address).content),
                 RemedyForDiscovery(transfer, address), ""});
            discovery_ = Json::Value();
            return;
        }
        CheckIssuer();
        CheckEndpoint("authorization_endpoint", client_->GetAuthEndpoint(), mark);
        CheckEndpoint("token_endpoint", client_->GetTokenEndpoint(), mark);
        if (!client_->GetLogoutEndpoint().empty()) {
            // An organisation may have its own logout page.
            CheckEndpoint("end_session_endpoint", client_->GetLogoutEndpoint(), Mark::kNote);
        }
        CheckOffer("id_token_signing_alg_values_supported", "discovery.algorithms", "signatures of tokens",
                   AlgorithmsOf(client_.profile()),
                   "Configure the provider to sign the tokens of this client with one of them.");
        CheckOffer("token_endpoint_auth_methods_supported", "discovery.client_authentication", "client authentication",
                   {"client_secret_post"},
                   "Configure the provider to accept client_secret_post for this client: the secret in the form.");
    }

    /// Whether addresses of the document, or of its redirect, may be recommended: the client's secret will be sent
    /// there.
    bool IsDiscoverySecure() const { return boost::istarts_with(client_->GetWellknownEndpoint(), "https://"); }

    std::string RemedyForDiscovery(const Transfer &transfer, const std::string &address) {
        if (IsProvidersError(transfer)) {
            return kWait;
        }
        const std::string published = FindDiscovery(address, transfer.location);
        if (!published.empty()) {
            return "Set " + prefix_ + "wellknown to " + Quoted(published);
        }
        return NotFollowed(transfer) +
               "Copy the address of the discovery document from the provider. It usually ends in " + kWellknownPath;
    }

    /// Tries the usual variants of an address. Returns the one of a discovery document, or an empty text.
    std::string FindDiscovery(const std::string &address, const std::string &location) {
        const std::string base = WithoutTrailingSlashes(address);
        const std::string issuer = WithoutTrailingSlashes(TAVO::Web::StringMember(discovery_, "issuer"));
        for (const std::string &variant : {base, base + kWellknownPath, issuer + kWellknownPath, location}) {
            const bool isNew = variant != address && boost::istarts_with(variant, "https://") &&
                               (variant != location || IsDiscoverySecure());
            if (isNew && IsDiscoveryDocument(TAVO::Web::ParseObject(Fetch(variant).content))) {
                return variant;
            }
        }
        return {};
    }

    void CheckIssuer() {
        const std::string issuer = TAVO::Web::StringMember(discovery_, "issuer");
        constexpr char kSubject[] = "issuer";
        if (issuer.empty()) {
            report_.Note("discovery.issuer", kSubject, "the document has none",
                         "Compare " + prefix_ + "wellknown with the provider's address.");
        } else if (boost::starts_with(client_->GetWellknownEndpoint(), issuer)) {
            report_.Good("discovery.issuer", kSubject, Quoted(issuer));
        } else {
            report_.Note("discovery.issuer", kSubject,
                         Quoted(issuer) + " is not the beginning of the document's address",
                         "None for Azure AD. Otherwise compare " + prefix_ + "wellknown with the provider's address.");
        }
    }

    void CheckEndpoint(const std::string &member, const std::string &configured, Mark mark) {
        const std::string published = TAVO::Web::StringMember(discovery_, member.c_str());
        const std::string id = "discovery." + member;
        if (published.empty()) {
            report_.Note(id, member, "the provider does not publish it");
        } else if (published == configured) {
            report_.Good(id, member, "as configured");
        } else if (!IsDiscoverySecure()) {
            report_.NotChecked(id, member,
                               "others on the network can change the document: its address is not https://");
        } else if (client_.Azure() != nullptr && !DoAddressesAgree(client_)) {
            report_.NotChecked(id, member, "the addresses in the file do not agree");
        } else {
            report_.Add({id, member, mark,
                         "the provider publishes " + Quoted(published) + ", the file has " + Quoted(configured),
                         "Set " + prefix_ + (member == "end_session_endpoint" ? "logout_endpoint" : member) + " to " +
                             Quoted(published),
                         ""});
        }
    }

    /// Compares what the provider offers, which it need not publish, with what the library supports.
    void CheckOffer(const char *member, const std::string &id, const std::string &subject,
                    const std::vector<std::string> &usable, const std::string &remedy) {
        const Json::Value &offers = discovery_[member];
        if (!offers.isArray()) {
            report_.Note(id, subject, "the provider does not publish which it supports");
            return;
        }
        for (const Json::Value &offer : offers) {
            if (offer.isString() && std::find(usable.begin(), usable.end(), offer.asString()) != usable.end()) {
                report_.Good(id, subject, "the provider supports " + offer.asString());
                return;
            }
        }
        report_.Finding(id, subject,
                        "the provider offers " + TAVO::Web::WriteCompact(offers) +
                            ", but the library needs one of: " + boost::join(usable, ", "),
                        remedy);
    }

    /// Sends the browser's first request. Most providers answer an unknown client or redirect URI with an error at
    /// once.
    void CheckAuthorization() {
        report_.Section("Authorization endpoint");
        constexpr char kSubject[] = "authorization endpoint";
        if (!CanSendClient("authorization_endpoint", kSubject, client_->GetAuthEndpoint())) {
            return;
        }
        Fetched fetched = Fetch(client_.AuthorizationURI(Json::objectValue));
        fetched.transfer.url = client_->GetAuthEndpoint();  // the query has hundreds of characters
        if (transfers_.Check("authorization_endpoint", kSubject, prefix_ + "authorization_endpoint",
                             fetched.transfer)) {
            ReportAuthorization(fetched);
        }
    }

    /// Returns whether client id and secret may be sent to an endpoint.
    bool CanSendClient(const std::string &id, const std::string &subject, const std::string &url) {
        const bool isSecure = boost::istarts_with(url, "https://");
        if (!isSecure || !MayPrintClientID(client_)) {
            report_.NotChecked(id + ".reachable", subject,
                               isSecure ? "the client id may be the client secret" : "it has no https:// URL");
            return false;
        }
        return true;
    }

    void ReportAuthorization(const Fetched &fetched) {
        constexpr char kID[] = "authorization_endpoint.request";
        constexpr char kSubject[] = "first request of a login";
        const Transfer &transfer = fetched.transfer;
        const auto query = TAVO::Web::ParseQuery(SplitAddress(transfer.location).query);
        const std::string error = TAVO::Web::OnlyValue(query, "error").value_or("");
        if (transfer.status < kRefusals && error.empty()) {
            report_.Good(kID, kSubject, "not rejected: HTTP " + std::to_string(transfer.status));
            return;
        }
        Json::Value answer;
        answer["error"] = error;
        answer["error_description"] = TAVO::Web::OnlyValue(query, "error_description").value_or("");
        report_.Finding(
            kID, kSubject,
            error.empty() ? "the provider rejects it: " + DescribeAnswer(transfer, fetched.content) : ErrorText(answer),
            RemedyForAuthorization(transfer, ErrorText(answer)));
    }

    std::string RemedyForAuthorization(const Transfer &transfer, const std::string &error) {
        constexpr char kMember[] = "authorization_endpoint";
        if (IsProvidersError(transfer)) {
            return kWait;
        }
        if (const TAVO::Web::FailureRow *row = FindProviderError(error)) {
            return WithoutBackticks(row->remedy);
        }
        if (transfer.status == kNotFound && Published(kMember) != client_->GetAuthEndpoint()) {
            return SetEndpoint(kMember);
        }
        return "Compare the client id, and " + Quoted(client_->GetRedirectURI()) +
               ", with those registered at the provider. For the provider's error page, run: sudo tavosso-doctor login";
    }

    /// Returns an address of the discovery document. Fetches the document for WebSphere, whose logins do not use it.
    std::string Published(const char *member) {
        if (!IsDiscoverySecure()) {
            return {};
        }
        if (client_.Azure() == nullptr && discovery_.isNull() && !client_->GetWellknownEndpoint().empty()) {
            client_->RequestWellknownInfo(discovery_);
            LastTransfer(report_);
        }
        return TAVO::Web::StringMember(discovery_, member);
    }

    std::string SetEndpoint(const std::string &member) {
        const std::string published = Published(member.c_str());
        return published.empty()
                   ? "Set " + prefix_ + member + " to the \"" + member + "\" of the provider's discovery document."
                   : "Set " + prefix_ + member + " to " + Quoted(published);
    }

    void CheckKeys() {
        report_.Section("Keys of the provider");
        constexpr char kSubject[] = "key set";
        const std::string address = TAVO::Web::StringMember(discovery_, "jwks_uri");
        if (address.empty()) {
            if (discovery_.isObject()) {
                report_.Finding("keys.reachable", kSubject, "the discovery document has no \"jwks_uri\"",
                                "Copy the address of the discovery document from the provider to azure_wellknown.");
            } else {
                report_.NotChecked("keys.reachable", kSubject, "its address is in the discovery document");
            }
            return;
        }
        Json::Value keySet;
        client_.Azure()->RequestKeysInfo(address, keySet);
        const Transfer transfer = LastTransfer(report_);
        if (!transfers_.Check("keys", kSubject, R"("jwks_uri" in the discovery document)", transfer)) {
            return;
        }
        if (keySet.isObject() && transfer.status == kSuccess) {
            CheckKeySet(report_, keySet);
        } else {
            report_.Finding("keys.set", kSubject,
                            address + " returns no key set: " + DescribeAnswer(transfer, Fetch(address).content),
                            IsProvidersError(transfer)
                                ? kWait
                                : NotFollowed(transfer) +
                                      "Check that azure_wellknown is the address of your provider's discovery "
                                      "document. If it is, report this to the provider.");
        }
    }

    void CheckTokenEndpoint() {
        report_.Section("Token endpoint");
        constexpr char kSubject[] = "token endpoint";
        if (!CanSendClient("token_endpoint", kSubject, client_->GetTokenEndpoint())) {
            return;
        }
        client_->SetCode(kTestCode);
        std::string response;
        client_->RequestTokenEndpoint(response, client_->GetIDTokenReqParams());
        const Transfer transfer = LastTransfer(report_);
        if (transfers_.Check("token_endpoint", kSubject, prefix_ + "token_endpoint", transfer)) {
            ReportAnswer(transfer, response);
        }
    }

    void ReportAnswer(const Transfer &transfer, const std::string &response) {
        Check check{"token_endpoint.client", "client at the token endpoint", Mark::kFinding, "", "",
                    LibraryOn(response)};
        const Json::Value answer = TAVO::Web::ParseObject(response);
        const std::string error = TAVO::Web::StringMember(answer, "error");
        const TAVO::Web::FailureRow *row = FindProviderError(ErrorText(answer));
        check.found = ErrorText(answer);
        if (IsProvidersError(transfer)) {
            check.found = DescribeAnswer(transfer, response);
            check.remedy = kWait;
        } else if (error.empty()) {
            check.found = "this is not a token endpoint: " + DescribeAnswer(transfer, response);
            check.remedy = NotFollowed(transfer) +
                           (Published("token_endpoint") == client_->GetTokenEndpoint()
                                ? "The discovery document has the same address. Report this to the provider."
                                : SetEndpoint("token_endpoint"));
        } else if (error == "invalid_grant" || row == nullptr || ConcernsCode(*row)) {
            ReportRejectedCode(check, error);
        } else if (IsOfClient(*row)) {
            check.remedy = "Compare " + prefix_ +
                           "client_id with the provider's. If it is correct, create a new client "
                           "secret there, which may have expired, and set " +
                           prefix_ + "client_secret to it. The provider must accept client_secret_post.";
        } else {
            check.remedy = WithoutBackticks(row->remedy);
        }
        report_.Add(check);
    }

    /// The provider rejected the test code: by `invalid_grant`, or by a word of its own.
    void ReportRejectedCode(Check &check, const std::string &error) {
        if (IsOtherWithWrongSecret(error)) {
            check.mark = Mark::kGood;
            check.found = "the provider accepts the client's id and secret";
            check.library.clear();  // the expected answer
        } else if (error == "invalid_grant") {
            check.mark = Mark::kGood;
            check.found = "the provider did not reject the client's id and secret, but it may not have checked them";
            check.library.clear();
            report_.Unproved("that the client secret is correct: the provider checks the code before the secret");
        } else {
            check.mark = Mark::kNote;
            check.remedy = "The provider may have rejected the test code only. Run: sudo tavosso-doctor login";
        }
    }

    /// A provider that rejects a wrong secret before it checks the code has accepted the right one.
    bool IsOtherWithWrongSecret(const std::string &error) {
        std::string response;
        client_->RequestTokenEndpoint(response, WithSecret(client_->GetIDTokenReqParams(), kTestSecret));
        const Transfer transfer = LastTransfer(report_);
        const std::string other = TAVO::Web::StringMember(TAVO::Web::ParseObject(response), "error");
        const bool isRejected = other == "invalid_client" || other == "unauthorized_client" ||
                                other == "access_denied" || transfer.status == kUnauthorized;
        return transfer.result == CURLE_OK && isRejected && other != error;
    }

    std::string LibraryOn(const std::string &response) {
        try {
            client_->ProcessTokenResponse(response);
            return {};
        } catch (const std::exception &failure) {
            return TextOf(failure);
        }
    }

    Report &report_;
    Client &client_;
    Json::Value discovery_;
    std::string prefix_;  // of the keys in the client's file
    TransferChecks transfers_;
};

}  // namespace

void CheckProvider(Report &report, Client &client) {
    TakeTransfers();
    ProviderCheck(report, client).Run();
}

}  // namespace Doctor
