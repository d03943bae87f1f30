#include "web/failure.h"

#include <array>

#include "web/failure_lookup.h"
#include "web/refusal.h"
#include "web/web.h"

namespace TAVO::Web {

namespace {

constexpr char kNotSetUp[] =
    "Single sign-on is not completely set up on this device. Please ask your administrator for help.";
constexpr char kStartAgain[] = "Your sign-in took too long, or was already completed. Please start again.";
constexpr char kNotVerified[] =
    "This device could not verify the answer of your organisation. Please ask your administrator for help.";
constexpr char kNotReached[] =
    "Your organisation's sign-in service gave no usable answer. Please try again in a few minutes.";
constexpr char kNoName[] =
    "Your organisation gave no name that this device can use. Please ask your administrator for help.";
constexpr char kNotKnown[] =
    "Something went wrong on the way. Please try again; if it happens again, tell your administrator.";

struct Description {
    const char *name;
    const char *sentence;
};

// In the order of the enumeration.
constexpr std::array kDescriptions = {
    Description{"switched_off",
                "Single sign-on is switched off on this device. Please ask your administrator for help."},
    Description{"not_set_up", kNotSetUp},
    Description{"not_permitted", kNotSetUp},
    Description{"too_many_logins", "Too many sign-ins are under way on this device. Try again in a few minutes."},
    Description{"storage", kNotKnown},
    Description{"invalid_request", kNotKnown},
    Description{"other_browser",
                "This sign-in was not started in this browser, or was already completed. Please start it here."},
    Description{"login_expired", kStartAgain},
    Description{"state_changed", "For your safety this sign-in was stopped: it was changed on its way."},
    Description{"profile_changed", "The settings of this device were changed during your sign-in. Sign in again."},
    Description{"provider_refused",
                "Your organisation's sign-in service did not accept this sign-in. Please try again; if it happens "
                "again, tell your administrator."},
    Description{"network", kNotReached},
    Description{"certificate", kNotReached},
    Description{"invalid_response", kNotReached},
    Description{"invalid_token", kNotVerified},
    Description{"token_expired",
                "Your sign-in took too long. Please try again; if it happens again, the clock of this device may be "
                "wrong."},
    Description{"other_tenant",
                "Your account belongs to an organisation that this device does not serve. Please ask your "
                "administrator for help."},
    Description{"unknown_key", kNotVerified},
    Description{"invalid_signature", kNotVerified},
    Description{"other_login", "For your safety this sign-in was stopped: the answer belongs to another one."},
    Description{"user_name", kNoName},
    Description{"unverified_email",
                "Your organisation has not verified your e-mail address. Please ask your administrator for help."},
    Description{"unknown_domain",
                "Your account's domain is not known to this device. Please ask your administrator for help."},
    Description{"internal", kNotKnown},
};
static_assert(kDescriptions.size() == static_cast<std::size_t>(Failure::kInternal) + 1);

const Description &Describe(Failure failure) { return kDescriptions[static_cast<std::size_t>(failure)]; }

/// The row with the most specific text for a reason; null if there is none.
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

/// A text to look up in the table. Texts that the provider chose are not looked up.
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
    failed.hint = "Run `tavosso-doctor`. Check what `azure_wellknown` and the address in its \"jwks_uri\" answer.";
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
