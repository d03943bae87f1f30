#include "doctor/transfer_checks.h"

#include <openssl/x509_vfy.h>
#include <sso/sso.h>

#include <algorithm>
#include <boost/algorithm/string/predicate.hpp>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <iterator>
#include <limits>
#include <memory>

#include "doctor/address.h"
#include "doctor/diagnosis.h"
#include "doctor/proxy.h"

namespace Doctor {

namespace {

constexpr long kDay = 24L * 60 * 60;
constexpr long kSoon = 14 * kDay;  // time to replace a certificate
constexpr long kWrongClock = 60;   // tokens may be valid for a few minutes only
constexpr char kCertificateSubject[] = "certificate of the server";
constexpr char kTime[] = "%F %T UTC";

std::string Describe(const Certificate &certificate) {
    return certificate.subject + ", issued by " + certificate.issuer + ", valid from " +
           TimeText(certificate.begins, "%F") + " to " + TimeText(certificate.expires, "%F");
}

std::string ThisClock() { return "this machine's clock: " + TimeText(std::time(nullptr), kTime); }

std::size_t Ignore(char * /*bytes*/, std::size_t size, std::size_t count, void * /*response*/) { return size * count; }

/// Gets the certificates that libcurl shows only without verification. Sends no secret.
Transfer FetchUnverified(Report &report, const std::string &url) {
    try {
        std::string response;
        TAVO::SSO::httpGet(url, response, false, Ignore);
    } catch (const std::exception &) {
        // The transfer has the certificates or it has not.
    }
    return LastTransfer(report);
}

const Certificate &FirstToExpire(const std::vector<Certificate> &chain) {
    const auto expiry = [](const Certificate &certificate) {
        return certificate.expires == -1 ? std::numeric_limits<std::time_t>::max() : certificate.expires;
    };
    return *std::min_element(chain.begin(), chain.end(),
                             [&](const auto &a, const auto &b) { return expiry(a) < expiry(b); });
}

/// Loads a bundle like libcurl. One damaged certificate makes the others unusable.
bool CanLoad(const std::string &bundle) {
    const std::unique_ptr<X509_STORE, void (*)(X509_STORE *)> store(X509_STORE_new(), X509_STORE_free);
    return store && X509_STORE_load_locations(store.get(), bundle.c_str(), nullptr) == 1;
}

struct Rejection {
    std::string cause;
    std::string remedy;
};

constexpr char kAddAuthority[] =
    "Ask the provider for the certificate of its authority. Copy it to /usr/local/share/ca-certificates/NAME.crt and "
    "run: sudo update-ca-certificates";
constexpr char kCompareClock[] = " If the clock is wrong, run: sudo timedatectl set-ntp true";

/// In words, why OpenSSL or libcurl rejects the chain.
Rejection WhyRejected(const Transfer &transfer, const std::vector<Certificate> &chain, const std::string &key) {
    const std::string host = SplitAddress(transfer.url).host;
    switch (transfer.verification) {
        case X509_V_OK:
        case X509_V_ERR_UNSPECIFIED:  // libcurl's initial value: the chain was not checked after the host name
        case X509_V_ERR_HOSTNAME_MISMATCH:
            return {
                "the host name " + Quoted(host) +
                    " is not among its names: " + (chain.front().names.empty() ? "none" : chain.front().names),
                "Set " + key + " to an address with one of these names, or ask the provider for another certificate."};
        case X509_V_ERR_CERT_HAS_EXPIRED: {
            const Certificate &expired = FirstToExpire(chain);
            return {(&expired == &chain.front() ? "it" : "the certificate of its authority " + expired.subject) +
                        " expired on " + TimeText(expired.expires, kTime),
                    std::string("The provider must renew the certificate.") + kCompareClock};
        }
        case X509_V_ERR_CERT_NOT_YET_VALID:
            return {"it is valid from " + TimeText(chain.front().begins, kTime),
                    "Compare the clock with the certificate's dates. To set it, run: sudo timedatectl set-ntp true"};
        case X509_V_ERR_DEPTH_ZERO_SELF_SIGNED_CERT:
            return {"it is self-signed", "Check the host in " + key +
                                             ". A proxy that inspects TLS also presents its own certificate. " +
                                             kAddAuthority};
        case X509_V_ERR_SELF_SIGNED_CERT_IN_CHAIN:
        case X509_V_ERR_UNABLE_TO_GET_ISSUER_CERT:
        case X509_V_ERR_UNABLE_TO_GET_ISSUER_CERT_LOCALLY:
        case X509_V_ERR_UNABLE_TO_VERIFY_LEAF_SIGNATURE:
            return {"its authority is unknown to this machine",
                    std::string(kAddAuthority) +
                        (chain.size() == 1 ? ". The server sends no intermediate certificate. If the authority is a "
                                             "public one, the provider must add it."
                                           : "")};
        default:
            return {X509_verify_cert_error_string(transfer.verification),
                    "The provider must replace the certificate. Send this line to the provider."};
    }
}

}  // namespace

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

bool TransferChecks::CheckMachine(const std::string &url) {
    CheckProxy(url);
    return CheckAuthorities();
}

void TransferChecks::CheckProxy(const std::string &url) {
    if (const std::optional<Proxy> proxy = ProxyFor(SplitAddress(url))) {
        report_.Note(
            "network.proxy", "proxy", proxy->variable + " sets the proxy " + proxy->server,
            "Set the same variable in the web server's settings; for the example front end, also name it in "
            "FRONTEND_KEEP_ENVIRONMENT. This command has the environment of sudo, which the web server does not have.");
    }
}

bool TransferChecks::CheckAuthorities() {
    constexpr char kID[] = "network.authorities";
    constexpr char kSubject[] = "certificate authorities";
    const char *bundle = curl_version_info(CURLVERSION_NOW)->cainfo;
    const std::string path = bundle != nullptr ? bundle : "";
    std::ifstream file(path);
    const bool isReadable = file.good();
    const std::string content{std::istreambuf_iterator<char>(file), {}};
    const bool isUsable = path.empty() || CanLoad(path);
    if (isUsable) {
        report_.Good(kID, kSubject, path.empty() ? "libcurl's default" : path);
    } else {
        report_.Finding(kID, kSubject,
                        path +
                            (!isReadable       ? " is missing or cannot be read"
                             : content.empty() ? " is empty"
                                               : " contains no certificate, or a damaged one") +
                            ": no certificate can be verified",
                        "Run: sudo apt-get install --reinstall ca-certificates; sudo update-ca-certificates --fresh");
    }
    return isUsable;
}

bool TransferChecks::Check(const std::string &id, const std::string &subject, const std::string &key,
                           const Transfer &transfer, Mark mark) {
    if (transfer.isSkipped) {
        report_.NotChecked(id + ".reachable", subject,
                           SplitAddress(transfer.url).host + " did not answer an earlier request");
        return false;
    }
    if (transfer.result == CURLE_OK) {
        report_.Good(id + ".reachable", subject, transfer.url);
        CheckExpiry(id, transfer, mark);
        CheckClock(transfer);
        return true;
    }
    if (transfer.result == CURLE_PEER_FAILED_VERIFICATION) {
        ReportRejectedCertificate(id, key, transfer, mark);
        report_.NotChecked(id + ".reachable", subject, "the certificate is rejected");
        return false;
    }
    const Diagnosis diagnosis = Diagnose(transfer, key);
    report_.Add({id + ".reachable", subject, mark, transfer.url + ": " + diagnosis.cause + " (" + transfer.error + ")",
                 diagnosis.remedy, ""});
    return false;
}

void TransferChecks::ReportRejectedCertificate(const std::string &id, const std::string &key, const Transfer &transfer,
                                               Mark mark) {
    const Transfer unverified = FetchUnverified(report_, transfer.url);
    const std::vector<Certificate> &chain = unverified.certificates;
    if (chain.empty()) {
        report_.Add({id + ".certificate", kCertificateSubject, mark, transfer.error + "; " + ThisClock(),
                     "Report this to the provider.", ""});
        return;
    }
    const Rejection rejection = WhyRejected(transfer, chain, key);
    if (reportedCertificates_.insert(Describe(chain.front())).second) {
        report_.Add({id + ".certificate", kCertificateSubject, mark,
                     rejection.cause + "; " + Describe(chain.front()) + "; " + ThisClock(), rejection.remedy, ""});
    }
    CheckClock(unverified);
}

void TransferChecks::CheckExpiry(const std::string &id, const Transfer &transfer, Mark mark) {
    if (transfer.certificates.empty()) {
        return;  // without TLS, which is a finding of the file
    }
    const Certificate &first = FirstToExpire(transfer.certificates);
    if (!reportedCertificates_.insert(Describe(first)).second) {
        return;
    }
    const std::time_t left = first.expires - std::time(nullptr);
    const std::string found = Describe(first) + ", " + std::to_string(left / kDay) + " days left";
    if (first.expires != -1 && left < kSoon) {
        report_.Add({id + ".certificate", kCertificateSubject, mark, found + "; " + ThisClock(),
                     "The provider must renew the certificate before it expires.", ""});
    } else {
        report_.Good(id + ".certificate", kCertificateSubject, found);
    }
}

void TransferChecks::CheckClock(const Transfer &transfer) {
    if (knowsClock_ || transfer.date == -1) {
        return;
    }
    knowsClock_ = true;
    const long offset = static_cast<long>(std::time(nullptr) - transfer.date);
    const std::string found = offset == 0 ? "as the provider's"
                                          : std::to_string(std::labs(offset)) + " s " +
                                                (offset > 0 ? "ahead of" : "behind") + " the provider's";
    if (std::labs(offset) > kWrongClock) {
        report_.Finding(
            "clock", "clock of this machine", found + "; " + ThisClock(),
            "Compare this machine's clock with the right time. If it is wrong, run: sudo timedatectl set-ntp "
            "true. If it is right, the provider's clock is wrong: report it to the provider.");
    } else {
        report_.Good("clock", "clock of this machine", found);
    }
}

}  // namespace Doctor
