#include "web/failure.h"

#include <array>

#include "web/failure_lookup.h"
#include "web/refusal.h"
#include "web/web.h"

namespace TAVO::Web {

namespace {

constexpr char kNotSetUp[] = "Single sign-on is not completely set up on this device. Contact your administrator.";
constexpr char kStartAgain[] = "Your sign-in took too long, or was already completed. Sign in again.";
constexpr char kStopped[] = "For your security, this sign-in was stopped. Sign in again.";
constexpr char kNotVerified[] =
    "This device could not verify the response of your organisation. Contact your administrator.";
constexpr char kNotReached[] = "Your organisation's sign-in service is not available. Try again in a few minutes.";
constexpr char kNoName[] =
    "Your organisation did not send a user name that this device can use. Contact your administrator.";
constexpr char kNotKnown[] = "Something went wrong. Try again. If the problem persists, contact your administrator.";

struct Description {
    const char *name;
    const char *sentence;
};

// In the order of `Failure`.
constexpr std::array kDescriptions = {
    Description{"switched_off", "Single sign-on is switched off on this device. Contact your administrator."},
    Description{"not_set_up", kNotSetUp},
    Description{"not_permitted", kNotSetUp},
    Description{"too_many_logins", "Too many users are signing in to this device. Try again in a few minutes."},
    Description{"storage", kNotKnown},
    Description{"invalid_request", kNotKnown},
    Description{"other_browser",
                "This sign-in was not started in this browser, or was already completed. Sign in again."},
    Description{"login_expired", kStartAgain},
    Description{"state_changed", kStopped},
    Description{"profile_changed", "The settings of this device changed during your sign-in. Sign in again."},
    Description{
        "provider_refused",
        "Your organisation rejected this sign-in. Try again. If the problem persists, contact your administrator."},
    Description{"network", kNotReached},
    Description{"certificate", kNotReached},
    Description{"invalid_response", kNotReached},
    Description{"invalid_token", kNotVerified},
    Description{
        "token_expired",
        "Your sign-in took too long. Try again. If the problem persists, the clock of this device may be wrong."},
    Description{"other_tenant",
                "Your account belongs to an organisation that cannot use this device. Contact your administrator."},
    Description{"unknown_key", kNotVerified},
    Description{"invalid_signature", kNotVerified},
    Description{"other_login", kStopped},
    Description{"user_name", kNoName},
    Description{"unverified_email",
                "Your organisation has not verified your e-mail address. Contact your administrator."},
    Description{"unknown_domain", "This device does not recognise your account's domain. Contact your administrator."},
    Description{"internal", kNotKnown},
};
static_assert(kDescriptions.size() == static_cast<std::size_t>(Failure::kInternal) + 1);

const Description &Describe(Failure failure) { return kDescriptions[static_cast<std::size_t>(failure)]; }

/// Returns the row with the most specific text for a reason, or null.
const FailureRow *FindRow(const std::string &reason) {
    const FailureRow *found = nullptr;
    std::size_t most = 0;
    for (const FailureRow &row : FailureTable()) {
        for (const char *text : row.texts) {
            const bool endsLogin = row.kind == FailureKind::kReason || row.kind == FailureKind::kException;
            if (endsLogin && IsText(reason, text) && Specificity(text) > most) {
                found = &row;
                most = Specificity(text);
            }
        }
    }
    return found;
}

/// Returns the text to look up in the table. The provider chooses some texts; these are not looked up.
std::string TextInTable(const std::exception &error) {
    if (dynamic_cast<const ProviderRefusal *>(&error) != nullptr) {
        return kReturnedError;
    }
    return ProviderErrorOf(error) ? kErrorAnswer : ReasonOf(error);
}

}  // namespace

std::string SentenceOf(Failure failure) { return Describe(failure).sentence; }

std::string NameOf(Failure failure) { return Describe(failure).name; }

FailedLogin FailedLoginOf(const std::exception &error) {
    FailedLogin failed;
    failed.reason = ReasonOf(error);
    failed.providerError = ProviderErrorOf(error).value_or("");
    if (const FailureRow *row = FindRow(TextInTable(error))) {
        failed.failure = row->code;
        failed.hint = row->remedy;
    } else if (dynamic_cast<const StoreFailure *>(&error) != nullptr) {
        failed.failure = Failure::kStorage;
    }
    failed.sentence = SentenceOf(failed.failure);
    return failed;
}

FailedLogin UnusableDocuments(FailedLogin failed) {
    failed.failure = Failure::kInvalidResponse;
    failed.sentence = SentenceOf(failed.failure);
    failed.hint = R"(Run `tavosso-doctor`. Check the documents at `azure_wellknown` and at its "jwks_uri".)";
    return failed;
}

FailedLogin FailedTransfer(FailedLogin failed, CURLcode result) {
    const FailureRow *row = FindTransfer(result);
    failed.failure = row != nullptr ? row->code : Failure::kNetwork;
    failed.sentence = Describe(failed.failure).sentence;
    failed.hint = row != nullptr ? row->remedy : curl_easy_strerror(result);
    return failed;
}

}  // namespace TAVO::Web
