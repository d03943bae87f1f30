#include "frontend/cgi_program.h"

#include <sso/sso.h>
#include <sys/prctl.h>
#include <sys/resource.h>
#include <syslog.h>
#include <unistd.h>

#include <algorithm>
#include <boost/algorithm/string.hpp>
#include <iostream>
#include <system_error>
#include <vector>

#include "frontend/environment.h"
#include "frontend/page.h"
#include "web/refusal.h"
#include "web/text.h"

namespace Frontend {

// In seconds. The web server's limit (lighttpd.conf) is 60 seconds, so that it can still answer the browser. lighttpd
// 1.4.69 does not apply its limit to a request that arrives together with its connection.
const unsigned int kLongestRun = 70;

namespace {

// An endless response of the provider must not exhaust the machine's memory.
constexpr rlim_t kAddressSpace = rlim_t{1} << 30;

void Limit(decltype(RLIMIT_CORE) resource, rlim_t most) {
    rlimit limit{};
    const bool isKnown = getrlimit(resource, &limit) == 0;
    limit.rlim_cur = limit.rlim_max = std::min(most, limit.rlim_max);  // keep a smaller limit of the web server
    if (!isKnown || setrlimit(resource, &limit) != 0) {
        throw std::system_error(errno, std::generic_category(), "A limit cannot be set");
    }
}

void LimitProcess() {
    alarm(kLongestRun);
    Limit(RLIMIT_CORE, 0);
    prctl(PR_SET_DUMPABLE, 0);
#ifndef __SANITIZE_ADDRESS__  // the sanitizer reserves terabytes
    Limit(RLIMIT_AS, kAddressSpace);
#endif
}

void RefuseMethod(Web::Response &response, const std::string &methods) {
    response.AddHeader("Allow", methods);
    const Messages messages(Variable("HTTP_ACCEPT_LANGUAGE"));
    ShowPage(response, "405 Method Not Allowed", messages, "method.title",
             "<p><a href=\"/index.cgi\">" + messages["method.start_page"] + "</a></p>\n");
}

}  // namespace

void Fail(Web::Response &response, const std::string &reason, const std::string &origin) {
    syslog(LOG_AUTH | LOG_WARNING, "frontend: sign-in failed: %s", reason.c_str());
    // GetSSORelayURL copies the reason verbatim, so another parameter can follow it.
    std::string encoded = TAVO::SSO::URLEncode(reason);
    if (!origin.empty()) {
        encoded += "&origin=" + TAVO::SSO::URLEncode(origin);
    }
    response.Redirect("/webman/" + TAVO::SSO::GetSSORelayURL(false, "", encoded));
}

namespace {

bool Write(const Web::Response &response) {
    std::cout << "Status: " << response.status << "\n";
    for (const auto &[name, value] : response.headers) {
        std::cout << name << ": " << value << "\n";
    }
    std::cout << "\n" << response.body << std::flush;
    return std::cout.good();
}

/// `methods` has the form of an Allow header.
bool IsAllowed(const std::string &methods) {
    std::vector<std::string> names;
    boost::split(names, methods, boost::is_any_of(", "), boost::token_compress_on);
    return std::find(names.begin(), names.end(), Variable("REQUEST_METHOD")) != names.end();
}

}  // namespace

int Serve(const std::string &methods, void (*serve)(Web::Response &)) {
    RemoveUntrustedVariables();
    Web::Response response;
    try {
        LimitProcess();
        if (IsAllowed(methods)) {
            serve(response);
        } else {
            RefuseMethod(response, methods);
        }
    } catch (const std::exception &failure) {
        Fail(response, Web::ReasonOf(failure), "");
    } catch (...) {
        Fail(response, "unexpected failure", "");
    }
    return Write(response) ? 0 : 1;
}

}  // namespace Frontend
