#ifndef TAVOSSO_DOCTOR_ADDRESS_H
#define TAVOSSO_DOCTOR_ADDRESS_H

#include <string>

namespace Doctor {

/// The components of a URL (RFC 3986).
struct Address {
    bool isValid = false;
    std::string scheme;
    std::string host;
    std::string port;  // the default of the scheme if the URL has none
    std::string path;
    std::string query;
    std::string fragment;
};

Address SplitAddress(const std::string &url);

}  // namespace Doctor

#endif
