#include "doctor/watch.h"

#include <dlfcn.h>
#include <netdb.h>
#include <sys/socket.h>
#include <unistd.h>

#include <boost/algorithm/string/predicate.hpp>
#include <chrono>
#include <cstdarg>
#include <cstdio>
#include <set>
#include <utility>

#include "doctor/address.h"
#include "doctor/report.h"

namespace Doctor {

namespace {

std::vector<std::string> logLines;
std::vector<Transfer> transfers;
TransferRules rules;
int refusals = 0;

constexpr long kRefusals = 300;  // and above, of a proxy

std::set<std::string> silentHosts;

/// A running transfer.
struct Watched {
    Transfer transfer;
    long headerBytes = 0;
};

/// Reads "Date" (RFC 9110, section 6.6.1).
std::size_t ReadHeader(char *line, std::size_t /*one*/, std::size_t length, void *watched) {
    auto &[transfer, headerBytes] = *static_cast<Watched *>(watched);
    headerBytes += static_cast<long>(length);
    if (headerBytes > kLongestResponse) {
        transfer.isTooLong = true;
        return 0;
    }
    const std::string text(line, length);
    constexpr char kDate[] = "date:";
    if (boost::istarts_with(text, kDate)) {
        transfer.date = curl_getdate(text.c_str() + sizeof kDate - 1, nullptr);
    }
    return length;
}

/// Stops a transfer whose content is too long.
int LimitContent(void *watched, curl_off_t /*expected*/, curl_off_t received, curl_off_t /*toSend*/,
                 curl_off_t /*sent*/) {
    Transfer &transfer = static_cast<Watched *>(watched)->transfer;
    transfer.isTooLong = transfer.isTooLong || received > kLongestResponse;
    return transfer.isTooLong ? 1 : 0;
}

/// Opens a socket, and records the address that it is for.
curl_socket_t OpenSocket(void *watched, curlsocktype /*purpose*/, curl_sockaddr *address) {
    char host[NI_MAXHOST];
    char port[NI_MAXSERV];
    if (getnameinfo(&address->addr, address->addrlen, host, sizeof host, port, sizeof port,
                    NI_NUMERICHOST | NI_NUMERICSERV) == 0) {
        static_cast<Watched *>(watched)->transfer.addresses.push_back(std::string(host) + " port " + port);
    }
    return socket(address->family, address->socktype | SOCK_CLOEXEC, address->protocol);
}

/// The transfer whose sockets are being closed; null for the connections that libcurl keeps until the end.
Transfer *connecting = nullptr;

/// Closes a socket, and records whether it was connected. libcurl does not report this if TLS fails.
int CloseSocket(void * /*unused*/, curl_socket_t closed) {
    sockaddr_storage peer = {};
    socklen_t length = sizeof peer;
    if (connecting != nullptr && getpeername(closed, reinterpret_cast<sockaddr *>(&peer), &length) == 0) {
        connecting->isConnected = true;
    }
    return close(closed);
}

Certificate ReadCertificate(const curl_slist *fields) {
    Certificate certificate;
    const auto valueOf = [](const std::string &field, const char *name, std::string &value) {
        if (boost::starts_with(field, name)) {
            value = field.substr(std::string(name).size());
        }
    };
    std::string begins;
    std::string expires;
    for (; fields != nullptr; fields = fields->next) {
        valueOf(fields->data, "Subject:", certificate.subject);
        valueOf(fields->data, "Issuer:", certificate.issuer);
        valueOf(fields->data, "X509v3 Subject Alternative Name:", certificate.names);
        valueOf(fields->data, "Start date:", begins);
        valueOf(fields->data, "Expire date:", expires);
    }
    certificate.begins = begins.empty() ? -1 : curl_getdate(begins.c_str(), nullptr);
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

/// Shown on a terminal until the answer arrives.
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

Stage StageOf(CURL *handle, const Transfer &transfer) {
    curl_off_t secured = 0;
    curl_easy_getinfo(handle, CURLINFO_APPCONNECT_TIME_T, &secured);
    return secured > 0                   ? Stage::kSecured
           : transfer.isConnected        ? Stage::kConnected
           : !transfer.addresses.empty() ? Stage::kResolved
                                         : Stage::kBegun;
}

void ReadResult(CURL *handle, Transfer &transfer) {
    long systemError = 0;
    curl_easy_getinfo(handle, CURLINFO_OS_ERRNO, &systemError);
    transfer.systemError = static_cast<int>(systemError);
    curl_easy_getinfo(handle, CURLINFO_SSL_VERIFYRESULT, &transfer.verification);
    curl_easy_getinfo(handle, CURLINFO_HTTP_CONNECTCODE, &transfer.proxyStatus);
    curl_easy_getinfo(handle, CURLINFO_RESPONSE_CODE, &transfer.status);
    transfer.contentType = TextOf(handle, CURLINFO_CONTENT_TYPE);
    transfer.location = TextOf(handle, CURLINFO_REDIRECT_URL);
    transfer.certificates = ReadCertificates(handle);
    transfer.stage = StageOf(handle, transfer);
}

bool IsSilence(const Transfer &transfer) {
    return transfer.result == CURLE_COULDNT_RESOLVE_HOST || transfer.result == CURLE_COULDNT_RESOLVE_PROXY ||
           transfer.result == CURLE_COULDNT_CONNECT || transfer.result == CURLE_OPERATION_TIMEDOUT ||
           transfer.proxyStatus >= kRefusals;
}

void Run(CURL *handle, Watched &watched) {
    Transfer &transfer = watched.transfer;
    char error[CURL_ERROR_SIZE] = {};
    curl_easy_setopt(handle, CURLOPT_ERRORBUFFER, error);
    curl_easy_setopt(handle, CURLOPT_TIMEOUT, rules.timeout);
    curl_easy_setopt(handle, CURLOPT_CONNECTTIMEOUT, (rules.timeout + 1) / 2);
    curl_easy_setopt(handle, CURLOPT_QUICK_EXIT, 1L);  // a resolver that hangs would exceed the timeout
    curl_easy_setopt(handle, CURLOPT_CERTINFO, 1L);
    curl_easy_setopt(handle, CURLOPT_HEADERFUNCTION, ReadHeader);
    curl_easy_setopt(handle, CURLOPT_HEADERDATA, &watched);
    curl_easy_setopt(handle, CURLOPT_XFERINFOFUNCTION, LimitContent);
    curl_easy_setopt(handle, CURLOPT_XFERINFODATA, &watched);
    curl_easy_setopt(handle, CURLOPT_NOPROGRESS, 0L);
    curl_easy_setopt(handle, CURLOPT_OPENSOCKETFUNCTION, OpenSocket);
    curl_easy_setopt(handle, CURLOPT_OPENSOCKETDATA, &watched);
    curl_easy_setopt(handle, CURLOPT_CLOSESOCKETFUNCTION, CloseSocket);
    const Progress progress(transfer.url);
    const auto begin = std::chrono::steady_clock::now();
    static const auto perform = reinterpret_cast<CURLcode (*)(CURL *)>(dlsym(RTLD_NEXT, "curl_easy_perform"));
    connecting = &transfer;
    transfer.result = perform(handle);
    connecting = nullptr;
    transfer.seconds = std::chrono::duration<double>(std::chrono::steady_clock::now() - begin).count();
    transfer.error = *error != '\0' ? error : curl_easy_strerror(transfer.result);
    curl_easy_setopt(handle, CURLOPT_ERRORBUFFER, nullptr);
    ReadResult(handle, transfer);
}

CURLcode Perform(CURL *handle) {
    Watched watched;
    Transfer &transfer = watched.transfer;
    transfer.url = TextOf(handle, CURLINFO_EFFECTIVE_URL);
    const Address address = SplitAddress(transfer.url);
    const std::string host = address.host + ' ' + address.port;
    transfer.isSkipped = silentHosts.count(host) != 0;
    if (refusals > 0 || transfer.isSkipped) {
        transfer.result = CURLE_ABORTED_BY_CALLBACK;
    } else {
        Run(handle, watched);
        if (IsSilence(transfer)) {
            silentHosts.insert(host);
        }
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
