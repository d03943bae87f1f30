#ifndef TAVOSSO_DOCTOR_ADDRESS_H
#define TAVOSSO_DOCTOR_ADDRESS_H

#include <string>

namespace Doctor {

/// A URL (RFC 3986) in the pieces that a finding can be about.
struct Address {
    bool isValid = false;
    std::string scheme;
    std::string host;
    std::string path;
    std::string query;
    std::string fragment;
};

Address SplitAddress(const std::string &url);

}  // namespace Doctor

#endif
