// The provider, asked by the library itself.
#include <algorithm>
#include <boost/algorithm/string/join.hpp>
#include <boost/algorithm/string/predicate.hpp>
#include <cstdio>
#include <cstdlib>
#include <set>
#include <vector>

#include "doctor/address.h"
#include "doctor/checks.h"
#include "doctor/key_set.h"
#include "doctor/watch.h"
#include "web/failure_lookup.h"
#include "web/request.h"
#include "web/text.h"

namespace Doctor {

namespace {

constexpr long kDay = 24L * 60 * 60;
constexpr long kSoon = 14 * kDay;  // time enough for getting another certificate
constexpr long kWrongClock = 60;   // tokens may be valid for a few minutes only
constexpr long kSuccess = 200;
constexpr long kRefusals = 400;  // and above

// No provider has given out this one.
constexpr char kMadeUpCode[] = "tavosso-doctor-made-this-up";

/// What the library has just done: its one transfer, if it came to that, and its log lines for whoever wants to see.
Transfer LastTransfer(Report &report) {
    Transfer last;
    last.result = CURLE_FAILED_INIT;
    for (const Transfer &transfer : TakeTransfers()) {
        char line[64];
        std::snprintf(line, sizeof line, "HTTP %ld, %.0f ms: ", transfer.status, transfer.seconds * 1000);
        report.Detail(line + transfer.url);
        last = transfer;
    }
    for (const std::string &line : TakeLogLines()) {
        report.Detail("log: " + line);
    }
    return last;
}

std::string Describe(const Certificate &certificate) {
    return certificate.subject + ", of " + certificate.issuer + ", until " + TimeText(certificate.expires, "%F");
}

std::size_t Ignore(char * /*bytes*/, std::size_t size, std::size_t count, void * /*response*/) { return size * count; }

/// The certificate that was refused, which libcurl shows only to those who do not verify it. Nothing is sent there.
std::vector<Certificate> LookAtCertificates(Report &report, const std::string &url) {
    try {
        std::string response;
        TAVO::SSO::httpGet(url, response, false, Ignore);
    } catch (const std::exception &) {
        // Whatever it was: the certificates are there, or they are not.
    }
    return LastTransfer(report).certificates;
}

class ProviderCheck {
  public:
    ProviderCheck(Report &report, Client &client) : report_(report), client_(client) {}

    void Run() {
        CheckDiscovery();
        CheckAuthorization();
        if (client_.Azure() != nullptr) {
            CheckKeys();
        }
        CheckTokenEndpoint();
    }

  private:
    /// Whether an answer came, and a certificate's findings if not or soon not.
    bool CheckTransfer(const std::string &id, const std::string &subject, const Transfer &transfer) {
        if (transfer.result != CURLE_OK) {
            const std::string text = curl_easy_strerror(transfer.result);
            const TAVO::Web::FailureRow *row = TAVO::Web::FindTransfer(transfer.result);
            const std::string cause = row != nullptr ? row->cause : "";
            report_.Finding(id + ".reachable", subject,
                            transfer.url + ": " + text + (cause.empty() ? "" : " (" + cause + ")"),
                            // Not as a command to copy: the provider may have chosen the address.
                            "ask that address from this machine by other means, curl -v for instance");
            if (transfer.result == CURLE_PEER_FAILED_VERIFICATION) {
                ExplainRefusedCertificate(id, transfer.url);
            }
            return false;
        }
        report_.Good(id + ".reachable", subject, transfer.url);
        CheckCertificates(id, transfer.certificates);
        CheckClock(transfer);
        return true;
    }

    void ExplainRefusedCertificate(const std::string &id, const std::string &url) {
        const std::vector<Certificate> chain = LookAtCertificates(report_, url);
        if (chain.empty()) {
            return;
        }
        const Certificate &own = chain.front();
        const std::string subject = "certificate of the server";
        if (own.expires != -1 && own.expires < std::time(nullptr)) {
            report_.Finding(id + ".certificate", subject, Describe(own) + ": it has expired",
                            "the provider has to renew it; if the date is not past, set this machine's clock");
        } else {
            report_.Finding(id + ".certificate", subject, Describe(own),
                            "is " + Quoted(SplitAddress(url).host) +
                                " its name? is its issuer among the authorities of this machine "
                                "(/etc/ssl/certs/ca-certificates.crt)? has it begun to be valid?");
        }
    }

    void CheckCertificates(const std::string &id, const std::vector<Certificate> &chain) {
        if (chain.empty()) {
            return;  // without TLS, which is a finding already
        }
        const auto first = std::min_element(chain.begin(), chain.end(),
                                            [](const auto &a, const auto &b) { return a.expires < b.expires; });
        const long left = first->expires - std::time(nullptr);
        const std::string found = Describe(*first) + ", " + std::to_string(left / kDay) + " days left";
        if (!toldCertificates_.insert(found).second) {
            return;  // one server mostly has it all
        }
        if (left < kSoon) {
            report_.Finding(id + ".certificate", "certificate of the server", found,
                            "the provider has to renew it: from that day on every login fails");
        } else {
            report_.Good(id + ".certificate", "certificate of the server", found);
        }
    }

    /// Once, by whoever tells the time first.
    void CheckClock(const Transfer &transfer) {
        if (knowsClock_ || transfer.date == -1) {
            return;
        }
        knowsClock_ = true;
        const long offset = static_cast<long>(std::time(nullptr) - transfer.date);
        const std::string seconds = std::to_string(std::labs(offset)) + " s ";
        const std::string found =
            offset == 0 ? "as the provider's" : seconds + (offset > 0 ? "ahead of" : "behind") + " the provider's";
        if (std::labs(offset) > kWrongClock) {
            report_.Finding(
                "clock", "clock of this machine", found,
                "let it be set by the network (timedatectl set-ntp true): tokens expire by it, without leeway");
        } else {
            report_.Good("clock", "clock of this machine", found);
        }
    }

    void CheckDiscovery() {
        report_.Section("Provider");
        constexpr char kSubject[] = "discovery document";
        const std::string address = client_->GetWellknownEndpoint();
        if (address.empty()) {
            report_.NotChecked("discovery.reachable", kSubject, "its address is not set");
            return;
        }
        client_->RequestWellknownInfo(discovery_);
        const Transfer transfer = LastTransfer(report_);
        if (!CheckTransfer("discovery", kSubject, transfer)) {
            return;
        }
        if (!discovery_.isObject() || transfer.status != kSuccess) {
            report_.Finding("discovery.document", kSubject,
                            "the answer is no discovery document: HTTP " + std::to_string(transfer.status) +
                                (discovery_.isObject() ? ", JSON" : ", no JSON object"),
                            "compare the address with the provider's; it mostly ends in "
                            "/.well-known/openid-configuration");
            return;
        }
        CheckIssuer();
        CheckEndpoint("authorization_endpoint", client_->GetAuthEndpoint());
        CheckEndpoint("token_endpoint", client_->GetTokenEndpoint());
        if (!client_->GetLogoutEndpoint().empty()) {
            // An organisation may have a page of its own for it.
            CheckEndpoint("end_session_endpoint", client_->GetLogoutEndpoint(), Mark::kNote);
        }
        CheckOffer("id_token_signing_alg_values_supported", "discovery.algorithms", "signatures of tokens",
                   AlgorithmsOf(client_.profile()), "let the provider sign this client's tokens with one of them");
        CheckOffer("token_endpoint_auth_methods_supported", "discovery.client_authentication", "client authentication",
                   {"client_secret_post"},
                   "let the provider take the client's secret from the form (client_secret_post) for this client");
    }

    void CheckIssuer() {
        const std::string issuer = TAVO::Web::StringMember(discovery_, "issuer");
        constexpr char kSubject[] = "issuer";
        if (issuer.empty()) {
            report_.Note("discovery.issuer", kSubject, "the document names none", "is this the provider's address?");
        } else if (boost::starts_with(client_->GetWellknownEndpoint(), issuer)) {
            report_.Good("discovery.issuer", kSubject, Quoted(issuer));
        } else {
            report_.Note("discovery.issuer", kSubject,
                         Quoted(issuer) + " does not begin the address of its own document",
                         "usual for a provider of several tenants; otherwise ask whose document this is");
        }
    }

    void CheckEndpoint(const std::string &member, const std::string &configured, Mark mark = Mark::kFinding) {
        const std::string published = TAVO::Web::StringMember(discovery_, member.c_str());
        const std::string id = "discovery." + member;
        if (published.empty()) {
            report_.Note(id, member, "the provider publishes none");
        } else if (published == configured) {
            report_.Good(id, member, "as configured");
        } else {
            report_.Add({id, member, mark,
                         "the provider publishes " + Quoted(published) + ", the file has " + Quoted(configured),
                         "take the provider's, unless you know better", ""});
        }
    }

    /// What the library can do, among what the provider offers; a provider need not tell.
    void CheckOffer(const char *member, const std::string &id, const std::string &subject,
                    const std::vector<std::string> &usable, const std::string &remedy) {
        const Json::Value &offers = discovery_[member];
        if (!offers.isArray()) {
            report_.Note(id, subject, "the provider does not tell which it supports");
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
                            ", and none that is needed: " + boost::join(usable, ", "),
                        remedy);
    }

    /// The browser's first request, made without one: a provider that does not know the client, or not by this redirect
    /// URI, mostly says so at once.
    void CheckAuthorization() {
        report_.Section("Authorization endpoint");
        constexpr char kSubject[] = "authorization endpoint";
        if (!boost::istarts_with(client_->GetAuthEndpoint(), "https://")) {
            report_.NotChecked("authorization_endpoint.reachable", kSubject, "it has no https address");
            return;
        }
        try {
            std::string response;
            TAVO::SSO::httpGet(client_.AuthorizationURI(Json::objectValue), response, true, Ignore);
        } catch (const std::exception &) {
            // The transfer tells.
        }
        Transfer transfer = LastTransfer(report_);
        transfer.url = client_->GetAuthEndpoint();  // without a query of hundreds of characters
        if (CheckTransfer("authorization_endpoint", kSubject, transfer)) {
            ReportAuthorization(transfer);
        }
    }

    void ReportAuthorization(const Transfer &transfer) {
        constexpr char kID[] = "authorization_endpoint.request";
        constexpr char kSubject[] = "first request of a login";
        const auto error = TAVO::Web::OnlyValue(TAVO::Web::ParseQuery(SplitAddress(transfer.location).query), "error");
        if (transfer.status < kRefusals && !error) {
            report_.Good(kID, kSubject, "the provider does not refuse it: HTTP " + std::to_string(transfer.status));
            return;
        }
        report_.Finding(
            kID, kSubject,
            "the provider refuses it: HTTP " + std::to_string(transfer.status) + (error ? ", " + Quoted(*error) : ""),
            "are the client's id and the redirect URI registered there, letter by letter, host and port "
            "too? tavosso-doctor login gives the address to open: the page there may tell more");
    }

    void CheckKeys() {
        report_.Section("Keys of the provider");
        constexpr char kSubject[] = "key set";
        const std::string address = TAVO::Web::StringMember(discovery_, "jwks_uri");
        if (address.empty()) {
            if (discovery_.isObject()) {
                report_.Finding("keys.reachable", kSubject, "the discovery document has no \"jwks_uri\"",
                                "is azure_wellknown the address of the provider's discovery document?");
            } else {
                report_.NotChecked("keys.reachable", kSubject, "the discovery document tells its address");
            }
            return;
        }
        Json::Value keySet;
        client_.Azure()->RequestKeysInfo(address, keySet);
        if (CheckTransfer("keys", kSubject, LastTransfer(report_))) {
            CheckKeySet(report_, keySet);
        }
    }

    void CheckTokenEndpoint() {
        report_.Section("Token endpoint");
        constexpr char kSubject[] = "token endpoint";
        if (!boost::istarts_with(client_->GetTokenEndpoint(), "https://")) {
            report_.NotChecked("token_endpoint.reachable", kSubject, "the secret is sent over https alone");
            return;
        }
        client_->SetCode(kMadeUpCode);
        std::string response;
        client_->RequestTokenEndpoint(response, client_->GetIDTokenReqParams());
        const Transfer transfer = LastTransfer(report_);
        if (CheckTransfer("token_endpoint", kSubject, transfer)) {
            ReportAnswer(transfer, response);
        }
    }

    void ReportAnswer(const Transfer &transfer, const std::string &response) {
        Check check{"token_endpoint.client", "client at the token endpoint", Mark::kFinding, "", "",
                    LibraryOn(response)};
        const Json::Value answer = TAVO::Web::ParseObject(response);
        const std::string error = TAVO::Web::StringMember(answer, "error");
        check.found = ErrorText(answer);
        if (!answer.isObject()) {
            check.found = "the answer is no JSON: HTTP " + std::to_string(transfer.status);
            check.remedy = "compare the address with the provider's";
        } else if (error.empty()) {
            check.found = "the answer names no error, and yet a made-up code was sent: no token endpoint answers so";
            check.remedy = "compare the address with the provider's";
        } else if (error == "invalid_grant") {
            check.mark = Mark::kGood;
            check.found = "the provider accepts the client's id and secret";
            check.library.clear();  // an answer that was asked for
        } else if (error == "invalid_client" || error == "unauthorized_client") {
            check.remedy =
                "compare the client's id and secret with the provider's; has the secret run out? does the provider "
                "take it from the form (client_secret_post)?";
        } else if (error == "invalid_request") {
            // Some providers look at the code's form before they look at the client.
            check.mark = Mark::kNote;
            check.remedy = "it may be the made-up code alone; try tavosso-doctor login";
        } else {
            check.remedy = "look for this error in the provider's documentation";
        }
        report_.Add(check);
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
    bool knowsClock_ = false;
    std::set<std::string> toldCertificates_;
};

}  // namespace

void CheckProvider(Report &report, Client &client) {
    TakeTransfers();
    ProviderCheck(report, client).Run();
}

}  // namespace Doctor
