#include "doctor/watch.h"

#include <dlfcn.h>

#include <boost/algorithm/string/predicate.hpp>
#include <chrono>
#include <cstdarg>
#include <cstdio>
#include <utility>

#include "doctor/report.h"

namespace Doctor {

namespace {

std::vector<std::string> logLines;
std::vector<Transfer> transfers;
TransferRules rules;
int refusals = 0;

/// Of a header line the server's time, if it is the line that tells it (RFC 9110, section 6.6.1).
std::size_t ReadDate(char *line, std::size_t /*one*/, std::size_t length, void *date) {
    const std::string text(line, length);
    constexpr char kDate[] = "date:";
    if (boost::istarts_with(text, kDate)) {
        *static_cast<std::time_t *>(date) = curl_getdate(text.c_str() + sizeof kDate - 1, nullptr);
    }
    return length;
}

Certificate ReadCertificate(const curl_slist *fields) {
    Certificate certificate;
    const auto valueOf = [](const std::string &field, const char *name, std::string &value) {
        if (boost::starts_with(field, name)) {
            value = field.substr(std::string(name).size());
        }
    };
    std::string expires;
    for (; fields != nullptr; fields = fields->next) {
        valueOf(fields->data, "Subject:", certificate.subject);
        valueOf(fields->data, "Issuer:", certificate.issuer);
        valueOf(fields->data, "Expire date:", expires);
    }
    certificate.expires = expires.empty() ? -1 : curl_getdate(expires.c_str(), nullptr);
    return certificate;
}

std::vector<Certificate> ReadCertificates(CURL *handle) {
    std::vector<Certificate> certificates;
    curl_certinfo *chain = nullptr;
    if (curl_easy_getinfo(handle, CURLINFO_CERTINFO, &chain) == CURLE_OK && chain != nullptr) {
        for (int i = 0; i < chain->num_of_certs; ++i) {
            certificates.push_back(ReadCertificate(chain->certinfo[i]));
        }
    }
    return certificates;
}

std::string TextOf(CURL *handle, CURLINFO which) {
    char *text = nullptr;
    curl_easy_getinfo(handle, which, &text);
    return text != nullptr ? text : "";
}

/// A line of its own on a terminal, and gone when the answer is there.
class Progress {
  public:
    explicit Progress(const std::string &url) {
        if (rules.showProgress) {
            std::fprintf(stderr, "\r\033[K       asking %s ...", Printable(url).c_str());
        }
    }
    ~Progress() {
        if (rules.showProgress) {
            std::fputs("\r\033[K", stderr);
        }
    }
    Progress(const Progress &) = delete;
    Progress &operator=(const Progress &) = delete;
};

CURLcode Perform(CURL *handle) {
    Transfer transfer;
    curl_easy_setopt(handle, CURLOPT_TIMEOUT, rules.timeout);
    curl_easy_setopt(handle, CURLOPT_CERTINFO, 1L);
    curl_easy_setopt(handle, CURLOPT_HEADERFUNCTION, ReadDate);
    curl_easy_setopt(handle, CURLOPT_HEADERDATA, &transfer.date);
    transfer.url = TextOf(handle, CURLINFO_EFFECTIVE_URL);
    if (refusals > 0) {
        transfer.result = CURLE_ABORTED_BY_CALLBACK;
    } else {
        const Progress progress(transfer.url);
        const auto begin = std::chrono::steady_clock::now();
        static const auto perform = reinterpret_cast<CURLcode (*)(CURL *)>(dlsym(RTLD_NEXT, "curl_easy_perform"));
        transfer.result = perform(handle);
        transfer.seconds = std::chrono::duration<double>(std::chrono::steady_clock::now() - begin).count();
        curl_easy_getinfo(handle, CURLINFO_RESPONSE_CODE, &transfer.status);
        transfer.location = TextOf(handle, CURLINFO_REDIRECT_URL);
        transfer.certificates = ReadCertificates(handle);
    }
    transfers.push_back(transfer);
    return transfer.result;
}

void AddLogLine(const char *format, std::va_list arguments) {
    char line[1024];
    // The C library's knows %m. clang-tidy 14 does not see that the callers below have started the arguments.
    std::vsnprintf(line, sizeof line, format, arguments);  // NOLINT(clang-analyzer-valist.Uninitialized)
    logLines.emplace_back(line);
}

}  // namespace

std::vector<std::string> TakeLogLines() { return std::exchange(logLines, {}); }

std::string MessageOf(const std::string &logLine) {
    const std::size_t blank = logLine.find(' ');
    return blank == std::string::npos ? logLine : logLine.substr(blank + 1);
}

std::string TakeMessages() {
    std::string messages;
    for (const std::string &line : TakeLogLines()) {
        messages += "; " + MessageOf(line);
    }
    return messages;
}

std::vector<Transfer> TakeTransfers() { return std::exchange(transfers, {}); }
void SetTransferRules(const TransferRules &newRules) { rules = newRules; }

RefuseTransfers::RefuseTransfers() { ++refusals; }
RefuseTransfers::~RefuseTransfers() { --refusals; }

}  // namespace Doctor

// The library's calls of these functions come here. <syslog.h> is left out: under _FORTIFY_SOURCE it defines them.
extern "C" {

void syslog(int priority, const char *format, ...);
// What a library calls that was built with _FORTIFY_SOURCE, as packaged ones are.
// NOLINTNEXTLINE(bugprone-reserved-identifier,cert-dcl37-c,cert-dcl51-cpp): the C library's own name
void __syslog_chk(int priority, int flag, const char *format, ...);

void syslog(int /*priority*/, const char *format, ...) {
    std::va_list arguments;
    va_start(arguments, format);
    Doctor::AddLogLine(format, arguments);
    va_end(arguments);
}

// NOLINTNEXTLINE(bugprone-reserved-identifier,cert-dcl37-c,cert-dcl51-cpp): as above
void __syslog_chk(int /*priority*/, int /*flag*/, const char *format, ...) {
    std::va_list arguments;
    va_start(arguments, format);
    Doctor::AddLogLine(format, arguments);
    va_end(arguments);
}

CURLcode curl_easy_perform(CURL *curl) { return Doctor::Perform(curl); }
}
