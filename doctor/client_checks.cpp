// The client's file, key by key.
#include <sso/limits.h>

#include <algorithm>
#include <boost/algorithm/string/predicate.hpp>
#include <boost/algorithm/string/trim.hpp>
#include <iterator>
#include <vector>

#include "doctor/address.h"
#include "doctor/azure_checks.h"
#include "doctor/checks.h"
#include "doctor/file_text.h"
#include "doctor/guid.h"
#include "doctor/settings_file.h"
#include "doctor/watch.h"
#include "web/text.h"

namespace Doctor {

namespace {

enum class Kind {
    kSwitch,  // not read by logins
    kIdentifier,
    kGUID,      // an identifier of Azure AD
    kClientID,  // a GUID that may have been confused with the secret
    kSecret,
    kEndpoint,  // used verbatim
    kQueried,   // used with a query appended
    kLogout,    // the same, by logouts only
    kRedirectURI,
    kSpare,  // used neither by logins nor by logouts
};

struct Key {
    const char *name;  // without the profile's prefix
    Kind kind;
    std::string (*read)(Client &client);  // returns the library's value; null for the switch
};

constexpr Key kAzureKeys[] = {
    {"sso_enable", Kind::kSwitch, nullptr},
    {"wellknown", Kind::kEndpoint, [](Client &client) { return client->GetWellknownEndpoint(); }},
    {"client_id", Kind::kClientID, [](Client &client) { return client->GetClientID(); }},
    {"client_secret", Kind::kSecret, [](Client &client) { return client->GetClientSecret(); }},
    {"tenant_id", Kind::kGUID, [](Client &client) { return client.Azure()->GetTenantID(); }},
    {"authorization_endpoint", Kind::kQueried, [](Client &client) { return client->GetAuthEndpoint(); }},
    {"token_endpoint", Kind::kEndpoint, [](Client &client) { return client->GetTokenEndpoint(); }},
    {"redirect_uri", Kind::kRedirectURI, [](Client &client) { return client->GetRedirectURI(); }},
    {"logout_endpoint", Kind::kLogout, [](Client &client) { return client->GetLogoutEndpoint(); }},
};

constexpr Key kWebSphereKeys[] = {
    {"wellknown", Kind::kSpare, [](Client &client) { return client->GetWellknownEndpoint(); }},
    {"client_id", Kind::kIdentifier, [](Client &client) { return client->GetClientID(); }},
    {"client_secret", Kind::kSecret, [](Client &client) { return client->GetClientSecret(); }},
    {"authorization_endpoint", Kind::kQueried, [](Client &client) { return client->GetAuthEndpoint(); }},
    {"token_endpoint", Kind::kEndpoint, [](Client &client) { return client->GetTokenEndpoint(); }},
    {"redirect_uri", Kind::kRedirectURI, [](Client &client) { return client->GetRedirectURI(); }},
    {"logout_endpoint", Kind::kSpare, [](Client &client) { return client->GetLogoutEndpoint(); }},
};

std::vector<Key> KeysOf(Profile profile) {
    return profile == Profile::kAzure ? std::vector<Key>(std::begin(kAzureKeys), std::end(kAzureKeys))
                                      : std::vector<Key>(std::begin(kWebSphereKeys), std::end(kWebSphereKeys));
}

class KeyCheck {
  public:
    KeyCheck(Report &report, Client &client, const SettingsFile &file, const std::string &returnProgram)
        : report_(report), client_(client), file_(file), returnProgram_(returnProgram) {}

    void Run(const Key &key) {
        name_ = NameOf(client_.profile()) + "_" + key.name;
        id_ = std::string("client.") + key.name;
        if (key.kind == Kind::kSwitch) {
            CheckSwitch();
            return;
        }
        value_ = key.read(client_);
        if (key.kind == Kind::kSpare) {
            report_.Good(id_, name_, "neither sign-in nor sign-out uses it");
            return;
        }
        suffix_ = key.kind == Kind::kLogout ? ". Sign-in works, sign-out at the provider does not" : "";
        if (value_.empty()) {
            CheckEmpty(key);
            return;
        }
        if (boost::trim_copy(value_) != value_ || !TAVO::Web::IsPrintable(value_)) {
            Finding("begins or ends with a blank, or contains an invisible character",
                    "Type the value of " + name_ + " again. The library uses it verbatim.");
            return;
        }
        if (const std::string pasted = FindPastedCharacter(value_); !pasted.empty()) {
            Finding("contains a " + pasted, "Type the value of " + name_ + " again instead of pasting it.");
            return;
        }
        switch (key.kind) {
            case Kind::kGUID:
                CheckGUID();
                break;
            case Kind::kClientID:
                CheckClientID();
                break;
            case Kind::kSecret:
                CheckSecret();
                break;
            case Kind::kEndpoint:
            case Kind::kQueried:
            case Kind::kLogout:
                CheckEndpoint(key.kind);
                break;
            case Kind::kRedirectURI:
                CheckRedirectURI();
                break;
            default:
                report_.Good(id_, name_, Quoted(value_));
        }
    }

  private:
    void Finding(const std::string &found, const std::string &remedy) {
        report_.Finding(id_, name_, found + suffix_, remedy);
    }

    void CheckSwitch() {
        const Json::Value &value = file_.content[name_];
        if (value.isNull() || value.isBool()) {
            report_.Good(id_, name_, "sign-in does not use it; the profile decides");
        } else {
            report_.Note(id_, name_, "is not a boolean, so it counts as false; sign-in does not use it",
                         "Set " + name_ + " to true or false, without quotation marks.");
        }
    }

    void CheckEmpty(const Key &key) {
        const Json::Value &value = file_.content[name_];
        const std::string found = !file_.content.isMember(name_) ? "is missing"
                                  : value.isString()             ? "is empty"
                                                                 : "is not a string, so it counts as empty";
        if (key.kind == Kind::kLogout) {
            report_.Note(id_, name_, found + ": signing out ends the session of this machine only",
                         "Set " + name_ + R"( to the "end_session_endpoint" of the discovery document.)");
        } else {
            Finding(found,
                    "Set " + name_ + " in " + file_.path + ", in quotation marks, to " + SourceOf(key.kind) + ".");
        }
    }

    static std::string SourceOf(Kind kind) {
        return kind == Kind::kGUID                                    ? "the directory (tenant) ID at the provider"
               : kind == Kind::kClientID || kind == Kind::kIdentifier ? "the client (application) ID at the provider"
               : kind == Kind::kSecret                                ? "the client secret of the provider"
               : kind == Kind::kRedirectURI ? "the redirect URI that is registered at the provider"
                                            : "the address that the provider publishes";
    }

    void CheckGUID() {
        if (IsGUID(value_)) {
            report_.Good(id_, name_, Quoted(value_));
            return;
        }
        const std::string tenant = TenantOfAddresses(client_);
        Finding(Quoted(value_) + R"( is not a GUID. A token's "tid" always is)",
                "Set " + name_ + " to " +
                    (tenant.empty() ? SourceOf(Kind::kGUID) + R"(, such as "9f3c7a52-1b0e-4d43-8f0a-6c5d4e3f2a1b".)"
                                    : Quoted(tenant) + ", the tenant in the addresses."));
    }

    void CheckClientID() {
        if (IsGUID(value_)) {
            report_.Good(id_, name_, Quoted(value_));
            return;
        }
        const bool isSwapped = IsGUID(client_->GetClientSecret());
        Finding(std::string("is not a GUID") + (isSwapped ? ", and azure_client_secret is: they are swapped"
                                                          : ". Its value is not printed, it may be the client secret"),
                isSwapped ? "Swap the values of azure_client_id and azure_client_secret."
                          : "Set " + name_ + " to " + SourceOf(Kind::kClientID) + ".");
    }

    void CheckSecret() {
        const std::string found = "is set, " + std::to_string(value_.size()) + " bytes";
        const bool isKey = client_.profile() == Profile::kWebSphere;
        if (isKey && value_.size() > TAVO::SSO::kLongestSecret) {
            Finding(found + ": too long", "Request a client secret of at most " +
                                              std::to_string(TAVO::SSO::kLongestSecret) +
                                              " bytes from the provider. A longer one cannot verify tokens.");
        } else if (isKey && value_.size() < kShortestWebSphereKey) {
            report_.Note(id_, name_, found + ". An attacker who has a token can find a short secret by brute force",
                         "Request a client secret of at least " + std::to_string(kShortestWebSphereKey) +
                             " bytes from the provider.");
        } else {
            report_.Good(id_, name_, found);
        }
    }

    void CheckEndpoint(Kind kind) {
        const Address address = SplitAddress(value_);
        if (!address.isValid) {
            const std::string completed = "https://" + value_;
            Finding(Quoted(value_) + " is not a URL",
                    "Set " + name_ + " to " +
                        (SplitAddress(completed).isValid ? Quoted(completed)
                                                         : SourceOf(kind) + R"(, beginning with "https://".)"));
        } else if (address.scheme != "https") {
            Finding(Quoted(value_) + " is not an https:// URL" +
                        (kind == Kind::kLogout ? "" : ": others on the network can read secret, codes and tokens"),
                    "Set " + name_ + " to the https:// URL of the provider.");
        } else if (kind != Kind::kEndpoint && (!address.query.empty() || !address.fragment.empty())) {
            Finding(Quoted(value_) + " has a query or a fragment. The library appends a second query",
                    "Set " + name_ + " to " + Quoted(value_.substr(0, value_.find_first_of("?#"))) + ".");
        } else {
            report_.Good(id_, name_, Quoted(value_));
        }
    }

    void CheckRedirectURI() {
        const Address address = SplitAddress(value_);
        const bool isDefaultPort = address.port == (address.scheme == "http" ? "80" : "443");
        const std::string correct =
            Quoted("https://" + (address.isValid ? address.host : "HOST") +
                   (!address.isValid || isDefaultPort ? "" : ':' + address.port) + returnProgram_);
        if (!address.isValid || address.scheme != "https" || !address.fragment.empty()) {
            Finding(Quoted(value_) + " must be an https:// URL without a fragment",
                    "Set " + name_ + " to " + correct + " here and at the provider.");
        } else if (address.path != returnProgram_) {
            Finding(Quoted(value_) + " is not the address of the return program: its path is " + Quoted(address.path),
                    "Set " + name_ + " to " + correct +
                        " here and at the provider. If the return program has another path, name it with "
                        "--return-program.");
        } else {
            report_.Good(id_, name_, Quoted(value_));
        }
    }

    Report &report_;
    Client &client_;
    const SettingsFile &file_;
    const std::string &returnProgram_;
    std::string name_;
    std::string id_;
    std::string value_;
    std::string suffix_;  // of findings
};

void ReportIDs(Report &report, RunAs runAs) {
    constexpr char kID[] = "client.ids";
    constexpr char kSubject[] = "root's ids";
    for (const std::string &line : TakeLogLines()) {
        report.Detail(line);
        if (boost::contains(line, "ERROR: ENTERCriticalSection")) {
            if (runAs == RunAs::kOrdinaryUser) {
                report.NotChecked(kID, kSubject, "needs root");
            } else {
                report.Finding(kID, kSubject, "cannot be raised to root's to read the file",
                               runAs == RunAs::kRoot
                                   ? "Check for a security module or seccomp filter: aa-status, getenforce."
                                   : kStartAsRoot);
            }
            return;
        }
    }
    report.Good(kID, kSubject, "raised to read the file");
}

}  // namespace

bool MayPrintClientID(Client &client) {
    const std::string id = client->GetClientID();
    return client.Azure() == nullptr || id.empty() || IsGUID(id);
}

void HideSecrets(Report &report, Client &client) {
    report.Hide(client->GetClientSecret());
    if (!MayPrintClientID(client)) {
        report.Hide(client->GetClientID());
    }
}

void CheckClientFile(Report &report, Client &client, const std::string &returnProgram, RunAs runAs) {
    report.Section("Client (" + NameOf(client.profile()) + ")");
    HideSecrets(report, client);
    ReportIDs(report, runAs);
    const SettingsFile file =
        ReadSettingsFile(client.profile() == Profile::kAzure ? kAzureFile : kWebSphereFile, runAs);
    if (!file.problem.empty()) {
        report.Finding("client.file", "file", file.problem, file.remedy);
        return;
    }
    report.Good("client.file", "file", file.path + " is JSON");
    ReportText(report, "client", file);
    ReportRights(report, "client.rights", file, true);

    const std::vector<Key> keys = KeysOf(client.profile());
    std::vector<std::string> names;
    std::transform(keys.begin(), keys.end(), std::back_inserter(names),
                   [&](const Key &key) { return NameOf(client.profile()) + "_" + key.name; });
    ReportUnknownKeys(report, "client.unknown_key", file, names);
    KeyCheck check(report, client, file, returnProgram);
    for (const Key &key : keys) {
        check.Run(key);
    }
    if (client.Azure() != nullptr) {
        CheckAzureAddresses(report, client);
    }
}

}  // namespace Doctor
