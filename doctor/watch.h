#ifndef TAVOSSO_DOCTOR_WATCH_H
#define TAVOSSO_DOCTOR_WATCH_H

#include <curl/curl.h>

#include <ctime>
#include <string>
#include <vector>

// Observes the log lines and transfers of the library. Its calls are interposed, so the requests are those of a login.
namespace Doctor {

struct Certificate {
    std::string subject;
    std::string issuer;
    std::string names;         // subject alternative names
    std::time_t begins = -1;   // -1 if unknown
    std::time_t expires = -1;  // -1 if unknown
};

/// The last step of a transfer that succeeded.
enum class Stage { kBegun, kResolved, kConnected, kSecured };

struct Transfer {
    std::string url;
    CURLcode result = CURLE_OK;
    std::string error;                   // libcurl's description of this failure
    int systemError = 0;                 // errno of a failed connection
    long verification = 0;               // OpenSSL's result for the certificate
    long proxyStatus = 0;                // of the proxy's response to CONNECT
    std::vector<std::string> addresses;  // to which a connection was tried
    bool isConnected = false;            // also if TLS failed
    Stage stage = Stage::kBegun;
    bool isSkipped = false;  // the host did not answer an earlier transfer
    bool isTooLong = false;  // the response exceeds the limit
    long status = 0;
    std::string contentType;
    std::string location;  // absolute; empty unless the response is a redirect
    double seconds = 0;
    std::time_t date = -1;                  // of the "Date" header; -1 if there is none
    std::vector<Certificate> certificates;  // the server's own first; empty without TLS
};

constexpr long kLongestResponse = 4L << 20;  // in bytes, of headers and of content

/// Returns the log lines since the last call.
std::vector<std::string> TakeLogLines();

/// Returns a log line without source and line number.
std::string MessageOf(const std::string &logLine);

/// Returns the messages of the log lines, each after a semicolon.
std::string TakeMessages();

/// Returns the transfers since the last call.
std::vector<Transfer> TakeTransfers();

struct TransferRules {
    long timeout = 10;          // in seconds, for each response. Half of it is the limit for connecting
    bool showProgress = false;  // on standard error
};
void SetTransferRules(const TransferRules &rules);

/// While an object exists, every transfer fails without a request.
class RefuseTransfers {
  public:
    RefuseTransfers();
    ~RefuseTransfers();
    RefuseTransfers(const RefuseTransfers &) = delete;
    RefuseTransfers &operator=(const RefuseTransfers &) = delete;
};

}  // namespace Doctor

#endif
