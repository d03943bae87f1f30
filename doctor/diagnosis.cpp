#include "doctor/diagnosis.h"

#include <algorithm>
#include <boost/algorithm/string/join.hpp>
#include <cctype>
#include <cerrno>
#include <cmath>
#include <optional>
#include <system_error>

#include "doctor/address.h"
#include "doctor/explain.h"
#include "doctor/proxy.h"
#include "doctor/report.h"
#include "web/failure_lookup.h"

namespace Doctor {

namespace {

/// The provider may choose the host, so only a plain name is printed in a command.
bool IsPlainHost(const std::string &host) {
    return !host.empty() && host.front() != '-' && std::all_of(host.begin(), host.end(), [](char c) {
        return std::isalnum(static_cast<unsigned char>(c)) != 0 || c == '.' || c == '-';
    });
}

class Diagnostician {
  public:
    Diagnostician(const Transfer &transfer, const std::string &key)
        : transfer_(transfer),
          key_(key),
          address_(SplitAddress(transfer.url)),
          proxy_(ProxyFor(address_)),
          tried_(transfer.addresses.empty() ? "" : boost::join(transfer.addresses, ", ")) {}

    Diagnosis Diagnose() const {
        if (transfer_.isTooLong) {
            return {"the response is longer than " + std::to_string(kLongestResponse >> 20) + " MiB", CompareAddress()};
        }
        if (transfer_.proxyStatus >= 300) {
            return {"the proxy " + ProxyServer() + " answers HTTP " + std::to_string(transfer_.proxyStatus),
                    ProxyRemedy()};
        }
        switch (transfer_.result) {
            case CURLE_COULDNT_RESOLVE_HOST:
                return Unresolved();
            case CURLE_COULDNT_RESOLVE_PROXY:
                return {"the host name of the proxy " + ProxyServer() + " cannot be resolved", ProxyRemedy()};
            case CURLE_COULDNT_CONNECT:
                return NotConnected();
            case CURLE_OPERATION_TIMEDOUT:
                return Silent();
            case CURLE_SSL_CONNECT_ERROR:
                return {"no TLS connection: the port is not that of a TLS server, or there is no common TLS version",
                        "Check the port in " + key_ + ". A proxy or firewall that inspects TLS must let " + Host() +
                            " pass."};
            case CURLE_OUT_OF_MEMORY:
                return {"memory ran out, or a header of the response is too long", CompareAddress()};
            case CURLE_GOT_NOTHING:
            case CURLE_RECV_ERROR:
            case CURLE_SEND_ERROR:
            case CURLE_PARTIAL_FILE:
                return {"the connection broke", "Run the command again. If it repeats, allow connections to " + Host() +
                                                    " in the firewall or proxy that closes them."};
            default:
                return OfTable();
        }
    }

  private:
    /// A proxy is connected instead of the provider.
    std::string Whom() const { return proxy_ ? "the proxy " : ""; }

    std::string Host() const { return address_.host + " port " + address_.port; }

    std::string CompareAddress() const {
        return "Compare " + key_ +
               " with the address that the provider publishes. If it is correct, report this to the "
               "provider.";
    }

    /// The time that passed, in whole seconds.
    std::string NoAnswer() const { return "no answer within " + std::to_string(std::lround(transfer_.seconds)) + " s"; }

    std::string ProxyServer() const { return proxy_ ? proxy_->server : ""; }

    std::string ProxyRemedy() const {
        return proxy_ ? "Correct or unset " + proxy_->variable + " (" + proxy_->server +
                            "). It applies to this command only; the web server has its own environment."
                      : "";
    }

    /// A network that requires a proxy looks like one with a firewall.
    std::string OrProxy() const {
        return proxy_ ? " " + ProxyRemedy()
                      : " If this network requires a proxy, run: sudo https_proxy=http://PROXY:PORT tavosso-doctor";
    }

    /// The name server, or /etc/hosts, may have an old address.
    std::string CheckResolved() const {
        const bool isName = tried_.find(address_.host) == std::string::npos && IsPlainHost(address_.host);
        return isName ? ", and the address of the host, which /etc/hosts overrides: getent ahosts " + address_.host
                      : "";
    }

    Diagnosis Unresolved() const {
        const std::string test = IsPlainHost(address_.host) ? " Test: getent hosts " + address_.host + "." : "";
        return {
            "the host name " + Quoted(address_.host) + " cannot be resolved",
            "Compare the host name in " + key_ +
                " with the provider's. If it is correct, check the name server in /etc/resolv.conf, /etc/hosts, and "
                "\"hosts\" in /etc/nsswitch.conf." +
                test + OrProxy()};
    }

    Diagnosis NotConnected() const {
        const std::string reason =
            transfer_.systemError != 0 ? ": " + std::generic_category().message(transfer_.systemError) : "";
        const std::string cause = "cannot connect to " + Whom() + (tried_.empty() ? Host() : tried_) + reason;
        if (proxy_) {
            return {cause, ProxyRemedy()};
        }
        switch (transfer_.systemError) {
            case ENETUNREACH:
            case EHOSTUNREACH:
            case EADDRNOTAVAIL:
            case EAFNOSUPPORT:
                return {cause, "Check this machine's addresses and default route: ip address; ip route; ip -6 route." +
                                   OrProxy()};
            case EPERM:
            case EACCES:
                return {cause, "Allow outgoing connections to port " + address_.port +
                                   " in this machine's firewall: nft list ruleset."};
            default:
                return {cause, "Check host and port in " + key_ + CheckResolved() +
                                   ". If they are correct, allow outgoing connections to port " + address_.port +
                                   " in the firewall." + OrProxy()};
        }
    }

    Diagnosis Silent() const {
        if (transfer_.stage == Stage::kBegun) {
            return {
                NoAnswer() + " from the name server for " + Quoted(address_.host),
                "Check the name server in /etc/resolv.conf, and allow port 53 outwards in the firewall." + OrProxy()};
        }
        if (transfer_.stage == Stage::kResolved) {
            return {NoAnswer() + " from " + Whom() + tried_,
                    "Allow outgoing connections to port " + address_.port +
                        " in the firewall. If an address contains colons, check IPv6: "
                        "ip -6 route." +
                        OrProxy()};
        }
        return {NoAnswer() + " from " + Whom() + tried_ + ", which accepts connections",
                "Check the port in " + key_ +
                    ". If it is correct, run the command again with a longer --timeout. If it repeats, report it to "
                    "the provider."};
    }

    Diagnosis OfTable() const {
        const TAVO::Web::FailureRow *row = TAVO::Web::FindTransfer(transfer_.result);
        return row != nullptr ? Diagnosis{row->cause, WithoutBackticks(row->remedy)}
                              : Diagnosis{"the transfer failed", CompareAddress()};
    }

    const Transfer &transfer_;
    const std::string &key_;
    Address address_;
    std::optional<Proxy> proxy_;
    std::string tried_;
};

}  // namespace

Diagnosis Diagnose(const Transfer &transfer, const std::string &key) { return Diagnostician(transfer, key).Diagnose(); }

}  // namespace Doctor
