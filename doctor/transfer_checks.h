#ifndef TAVOSSO_DOCTOR_TRANSFER_CHECKS_H
#define TAVOSSO_DOCTOR_TRANSFER_CHECKS_H

#include <set>
#include <string>

#include "doctor/report.h"
#include "doctor/watch.h"

// What a transfer shows about network, proxy, certificates and clock.
namespace Doctor {

/// The last transfer of the library. Prints all of them and the log lines as details.
Transfer LastTransfer(Report &report);

class TransferChecks {
  public:
    explicit TransferChecks(Report &report) : report_(report) {}

    /// Reports a proxy, and whether this machine has certificate authorities. Returns the latter.
    bool CheckMachine(const std::string &url);

    /// Reports why there was no response, or the certificate. `key` is the setting with the address. A failure that
    /// does not affect sign-in is a note. Returns whether there was a response.
    bool Check(const std::string &id, const std::string &subject, const std::string &key, const Transfer &transfer,
               Mark mark = Mark::kFinding);

  private:
    void CheckProxy(const std::string &url);
    bool CheckAuthorities();
    void ReportRejectedCertificate(const std::string &id, const std::string &key, const Transfer &transfer, Mark mark);
    void CheckExpiry(const std::string &id, const Transfer &transfer, Mark mark);
    void CheckClock(const Transfer &transfer);

    Report &report_;
    bool knowsClock_ = false;
    std::set<std::string> reportedCertificates_;
};

}  // namespace Doctor

#endif
