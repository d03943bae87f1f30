#include "doctor/proxy.h"

#include <algorithm>
#include <boost/algorithm/string/classification.hpp>
#include <boost/algorithm/string/predicate.hpp>
#include <boost/algorithm/string/split.hpp>
#include <boost/algorithm/string/trim.hpp>
#include <cstdlib>
#include <vector>

namespace Doctor {

namespace {

std::string Variable(const std::string &name) {
    const char *value = std::getenv(name.c_str());
    return value != nullptr ? value : "";
}

/// no_proxy lists hosts and domains. An asterisk alone means all hosts.
bool IsExcepted(const std::string &host) {
    const std::string exceptions = Variable("no_proxy").empty() ? Variable("NO_PROXY") : Variable("no_proxy");
    std::vector<std::string> names;
    boost::split(names, exceptions, boost::is_any_of(", "), boost::token_compress_on);
    return exceptions == "*" || std::any_of(names.begin(), names.end(), [&](const std::string &name) {
               const std::string domain = boost::trim_left_copy_if(name, boost::is_any_of("."));
               return !domain.empty() && (boost::iequals(host, domain) || boost::iends_with(host, '.' + domain));
           });
}

std::string ServerOf(const std::string &proxy) {
    const Address address = SplitAddress(proxy.find("://") == std::string::npos ? "http://" + proxy : proxy);
    return address.host + (address.port.empty() ? "" : " port " + address.port);
}

}  // namespace

std::optional<Proxy> ProxyFor(const Address &address) {
    if (IsExcepted(address.host)) {
        return std::nullopt;
    }
    const std::vector<std::string> names =
        address.scheme == "https" ? std::vector<std::string>{"https_proxy", "HTTPS_PROXY", "all_proxy", "ALL_PROXY"}
                                  : std::vector<std::string>{"http_proxy", "all_proxy", "ALL_PROXY"};
    for (const std::string &name : names) {
        if (const std::string proxy = Variable(name); !proxy.empty()) {
            return Proxy{name, ServerOf(proxy)};
        }
    }
    return std::nullopt;
}

}  // namespace Doctor
