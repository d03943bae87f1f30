// The state, which carries what a front end remembers over a login.
#include "doctor/checks.h"

namespace Doctor {

namespace {

constexpr std::size_t kTooLong = 1024;

bool Fits(Client &client, std::size_t length) {
    Json::Value state;
    state["origin"] = std::string(length, 'x');
    try {
        client.AuthorizationURI(state);
        return true;
    } catch (const TAVO::SSO::sso_op_failed &) {
        return false;
    }
}

}  // namespace

void CheckState(Report &report, Client &client) {
    report.Section("State");
    constexpr char kID[] = "state.capacity";
    constexpr char kSubject[] = "room in the state";
    if (!Fits(client, 0)) {
        report.Finding(kID, kSubject, "no state can be made", "see the log: memory, or OpenSSL's configuration");
        return;
    }
    std::size_t fits = 0;
    std::size_t tooLong = kTooLong;
    while (tooLong - fits > 1) {
        const std::size_t middle = (fits + tooLong) / 2;
        (Fits(client, middle) ? fits : tooLong) = middle;
    }
    report.Good(kID, kSubject,
                "an \"origin\" of " + std::to_string(fits) +
                    " bytes fits, if nothing else is remembered; "
                    "characters that JSON escapes count twice or more");
}

}  // namespace Doctor
