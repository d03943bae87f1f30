#include "frontend/failure.h"

#include <sso/sso.h>
#include <syslog.h>
#include <unistd.h>

#include <iostream>

#include "frontend/text.h"

namespace Frontend {

namespace {

// In seconds; the web server's own limit is shorter, and has an answer for the browser. But lighttpd 1.4.69 does not
// hold a program to it whose request was there when its connection was accepted.
constexpr unsigned int kLongestRun = 70;

void Fail(Answer &answer, const std::string &reason) {
    syslog(LOG_AUTH | LOG_WARNING, "frontend: sign-in failed: %s", reason.c_str());
    // The relay address takes the reason as it stands, and so takes more than a reason.
    std::string encoded = TAVO::SSO::URLEncode(reason);
    if (!answer.origin.empty()) {
        encoded += "&origin=" + TAVO::SSO::URLEncode(answer.origin);
    }
    answer.Redirect("/webman/" + TAVO::SSO::GetSSORelayURL(false, "", encoded));
}

}  // namespace

std::string ReasonOf(const std::exception &failure) {
    const std::string text = failure.what();
    const std::size_t begin = text.find_first_not_of(" \t\r\n");
    if (begin == std::string::npos || (text[begin] != '{' && text[begin] != '[')) {
        return OneLine(text);
    }
    const Json::Value answer = ParseObject(text);
    return ProviderError(StringMember(answer, "error"), StringMember(answer, "error_description"));
}

std::string ProviderError(const std::string &error, const std::string &description) {
    const std::string named = error.empty() ? "unknown error" : error;
    return OneLine("The provider refused: " + named + (description.empty() ? "" : " (" + description + ")"));
}

int Serve(void (*serve)(Answer &)) {
    alarm(kLongestRun);
    Answer answer;
    try {
        serve(answer);
    } catch (const std::exception &failure) {
        Fail(answer, ReasonOf(failure));
    } catch (...) {
        Fail(answer, "unexpected failure");
    }
    std::cout.flush();
    return std::cout ? 0 : 1;
}

}  // namespace Frontend
