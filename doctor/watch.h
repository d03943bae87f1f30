#ifndef TAVOSSO_DOCTOR_WATCH_H
#define TAVOSSO_DOCTOR_WATCH_H

#include <curl/curl.h>

#include <ctime>
#include <string>
#include <vector>

// What the library does while the doctor has it work: its log lines and its transfers. The calls of the library can be
// interposed; so what is told here is of the very request that a login makes, under the same options.
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

/// The lines that would have gone to the system's log, since they were last taken.
std::vector<std::string> TakeLogLines();

/// A line without the source and its line, which tell an administrator nothing.
std::string MessageOf(const std::string &logLine);

/// The messages of these lines, each behind a semicolon: for the end of what is told as found.
std::string TakeMessages();

/// The transfers since they were last taken.
std::vector<Transfer> TakeTransfers();

struct TransferRules {
    long timeout = 10;          // in seconds, for each response. Half of it is the limit for connecting
    bool showProgress = false;  // on standard error
};
void SetTransferRules(const TransferRules &rules);

/// As long as one lives, every transfer fails before anyone is asked.
class RefuseTransfers {
  public:
    RefuseTransfers();
    ~RefuseTransfers();
    RefuseTransfers(const RefuseTransfers &) = delete;
    RefuseTransfers &operator=(const RefuseTransfers &) = delete;
};

}  // namespace Doctor

#endif
