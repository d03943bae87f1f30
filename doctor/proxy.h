#ifndef TAVOSSO_DOCTOR_PROXY_H
#define TAVOSSO_DOCTOR_PROXY_H

#include <optional>
#include <string>

#include "doctor/address.h"

namespace Doctor {

/// The proxy that libcurl uses for an address, and the environment variable that sets it.
struct Proxy {
    std::string variable;
    std::string server;  // host and port, without credentials
};

/// Reads the variables in the same order as libcurl.
std::optional<Proxy> ProxyFor(const Address &address);

}  // namespace Doctor

#endif
