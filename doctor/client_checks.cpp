// The client's file, key by key.
#include <sso/limits.h>

#include <algorithm>
#include <boost/algorithm/string/predicate.hpp>
#include <boost/algorithm/string/trim.hpp>
#include <iterator>
#include <regex>
#include <vector>

#include "doctor/address.h"
#include "doctor/checks.h"
#include "doctor/settings_file.h"
#include "doctor/watch.h"
#include "web/text.h"

namespace Doctor {

namespace {

enum class Kind {
    kSwitch,  // which no login looks at
    kIdentifier,
    kSecret,
    kEndpoint,  // that is asked as it stands
    kQueried,   // that a query is put behind
    kRedirectURI,
    kSpare,  // that no login needs
};

struct Key {
    const char *name;  // without the profile's prefix
    Kind kind;
    std::string (*read)(Client &client);  // as the library has read it; null for the switch
};

constexpr Key kAzureKeys[] = {
    {"sso_enable", Kind::kSwitch, nullptr},
    {"wellknown", Kind::kEndpoint, [](Client &client) { return client->GetWellknownEndpoint(); }},
    {"client_id", Kind::kIdentifier, [](Client &client) { return client->GetClientID(); }},
    {"client_secret", Kind::kSecret, [](Client &client) { return client->GetClientSecret(); }},
    {"tenant_id", Kind::kIdentifier, [](Client &client) { return client.Azure()->GetTenantID(); }},
    {"authorization_endpoint", Kind::kQueried, [](Client &client) { return client->GetAuthEndpoint(); }},
    {"token_endpoint", Kind::kEndpoint, [](Client &client) { return client->GetTokenEndpoint(); }},
    {"redirect_uri", Kind::kRedirectURI, [](Client &client) { return client->GetRedirectURI(); }},
    {"logout_endpoint", Kind::kQueried, [](Client &client) { return client->GetLogoutEndpoint(); }},
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
        if (value_.empty()) {
            CheckEmpty(key);
            return;
        }
        if (boost::trim_copy(value_) != value_ || !TAVO::Web::IsPrintable(value_)) {
            Finding("has blanks around it or control characters in it",
                    "take them out: the text is used as it stands, letter by letter");
            return;
        }
        switch (key.kind) {
            case Kind::kSecret:
                CheckSecret();
                break;
            case Kind::kEndpoint:
            case Kind::kQueried:
                CheckEndpoint(key.kind);
                break;
            case Kind::kRedirectURI:
                CheckRedirectURI();
                break;
            case Kind::kSpare:
                report_.Good(id_, name_, Quoted(value_) + "; no login uses it");
                break;
            default:
                report_.Good(id_, name_, Quoted(value_));
        }
    }

  private:
    void Finding(const std::string &found, const std::string &remedy) { report_.Finding(id_, name_, found, remedy); }

    void CheckSwitch() {
        const Json::Value &value = file_.content[name_];
        if (value.isNull() || value.isBool()) {
            report_.Good(id_, name_, "no login looks at it: the profile decides");
        } else {
            report_.Note(id_, name_, "is no boolean, and so counts as false; no login looks at it",
                         "set it to true or false");
        }
    }

    void CheckEmpty(const Key &key) {
        const Json::Value &value = file_.content[name_];
        const std::string found = !file_.content.isMember(name_) ? "is missing"
                                  : value.isString()             ? "is empty"
                                                                 : "is no text: the library takes it for empty";
        if (key.kind == Kind::kSpare) {
            report_.Good(id_, name_, found + "; no login uses it");
        } else if (id_ == "client.logout_endpoint") {
            report_.Note(id_, name_, found + ": a sign-out ends at this machine, and not at the provider",
                         "set it to the provider's " + Quoted("end_session_endpoint"));
        } else {
            Finding(found, "set it, in quotation marks, as the provider has registered or published it");
        }
    }

    void CheckSecret() {
        const std::string found = "is set, " + std::to_string(value_.size()) + " bytes";
        const bool isKey = client_.profile() == Profile::kWebSphere;
        if (isKey && value_.size() > TAVO::SSO::kLongestSecret) {
            Finding(found + ": too long", "get one of at most " + std::to_string(TAVO::SSO::kLongestSecret) +
                                              " bytes from the provider: with a longer one no token can be verified");
        } else if (isKey && value_.size() < kShortestWebSphereKey) {
            report_.Note(id_, name_,
                         found + ": the shorter a key, the easier it is found by trying, for whoever has a token",
                         "get one of at least " + std::to_string(kShortestWebSphereKey) + " bytes from the provider");
        } else {
            report_.Good(id_, name_, found);
        }
    }

    void CheckEndpoint(Kind kind) {
        const Address address = SplitAddress(value_);
        if (!address.isValid) {
            Finding(Quoted(value_) + " is no address", "write the whole of it, from https:// on");
        } else if (address.scheme != "https") {
            Finding(Quoted(value_) + " is not https: whoever listens on the way reads secret, codes and tokens",
                    "use the provider's https address");
        } else if (kind == Kind::kQueried && (!address.query.empty() || !address.fragment.empty())) {
            Finding(Quoted(value_) + " has a query or fragment of its own, behind which a second query would be put",
                    R"(leave out what stands from "?" or "#" on)");
        } else {
            report_.Good(id_, name_, Quoted(value_));
        }
    }

    void CheckRedirectURI() {
        const Address address = SplitAddress(value_);
        if (!address.isValid || address.scheme != "https" || !address.fragment.empty()) {
            Finding(Quoted(value_) + " is no https address without fragment",
                    "write it as it is registered at the provider: https://THIS-MACHINE" + returnProgram_);
        } else if (address.path != returnProgram_) {
            Finding(Quoted(value_) + " does not lead to the return program: its path is " + Quoted(address.path),
                    "let it end in " + Quoted(returnProgram_) +
                        ", here and at the provider; or tell of another program with --return-program");
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
};

/// Addresses of Azure AD hold the tenant by its id, by a domain name, or by a word for several tenants.
void CheckTenant(Report &report, Client &client) {
    constexpr char kID[] = "client.tenant";
    constexpr char kSubject[] = "tenant in the endpoints";
    const std::string tenant = client.Azure()->GetTenantID();
    const std::string endpoints[] = {client->GetWellknownEndpoint(), client->GetAuthEndpoint(),
                                     client->GetTokenEndpoint()};
    static const std::regex uuid("[0-9a-fA-F]{8}(-[0-9a-fA-F]{4}){3}-[0-9a-fA-F]{12}");
    bool occurs = false;
    for (const std::string &endpoint : endpoints) {
        const std::string looked = endpoint.substr(0, 2048);  // the expressions of the C++ library recurse
        occurs = occurs || (!tenant.empty() && boost::icontains(looked, tenant));
        std::smatch other;
        if (std::regex_search(looked, other, uuid) && !boost::iequals(other.str(), tenant)) {
            report.Finding(kID, kSubject,
                           Quoted(endpoint) + " belongs to the tenant " + other.str() + ", and azure_tenant_id is " +
                               Quoted(tenant),
                           "set azure_tenant_id to the directory whose users sign in, and take the addresses from it");
            return;
        }
    }
    if (occurs) {
        report.Good(kID, kSubject, "they name the tenant " + Quoted(tenant));
    } else {
        report.Note(kID, kSubject, "none of them names the tenant " + Quoted(tenant),
                    "compare it with the directory's id at the provider: a token's \"tid\" has to equal it");
    }
}

void ReportIDs(Report &report) {
    for (const std::string &line : TakeLogLines()) {
        report.Detail(line);
        if (boost::contains(line, "ERROR: ENTERCriticalSection")) {
            report.Finding("client.ids", "root's ids",
                           "this process could not become root for reading the file, nor can such a program",
                           "let the web server start its programs as root, or with root as saved ids");
            return;
        }
    }
    report.Good("client.ids", "root's ids", "the library could take them on for reading the file");
}

}  // namespace

void CheckClientFile(Report &report, Client &client, const std::string &returnProgram) {
    report.Section("Client (" + NameOf(client.profile()) + ")");
    report.Hide(client->GetClientSecret());
    ReportIDs(report);
    const SettingsFile file = ReadSettingsFile(client.profile() == Profile::kAzure ? kAzureFile : kWebSphereFile);
    if (!file.problem.empty()) {
        report.Finding("client.file", "file", file.problem,
                       file.isRefused
                           ? "leave its rights as they are, for it holds the secret: the web server has to start its "
                             "programs as root, or with root as saved ids"
                           : file.remedy);
        return;
    }
    report.Good("client.file", "file", file.path + " is JSON");
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
        CheckTenant(report, client);
    }
}

}  // namespace Doctor
