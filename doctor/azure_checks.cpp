#include "doctor/azure_checks.h"

#include <algorithm>
#include <boost/algorithm/string/case_conv.hpp>
#include <boost/algorithm/string/join.hpp>
#include <boost/algorithm/string/predicate.hpp>
#include <boost/algorithm/string/replace.hpp>
#include <iterator>
#include <vector>

#include "doctor/guid.h"

namespace Doctor {

namespace {

constexpr char kTenantID[] = "client.tenant";
constexpr char kTenantSubject[] = "tenant in the addresses";
constexpr char kVersionID[] = "client.version";
constexpr char kVersionSubject[] = "version of the addresses";

struct Endpoint {
    std::string key;
    std::string url;
};

std::vector<Endpoint> EndpointsOf(Client &client) {
    return {{"azure_wellknown", client->GetWellknownEndpoint()},
            {"azure_authorization_endpoint", client->GetAuthEndpoint()},
            {"azure_token_endpoint", client->GetTokenEndpoint()}};
}

/// Returns the tenant in an address; empty if there is none. A query may contain the client's id.
std::string TenantIn(const std::string &url) { return FindGUID(url.substr(0, url.find('?'))); }

std::string KeysOf(const std::vector<Endpoint> &endpoints) {
    std::vector<std::string> keys;
    std::transform(endpoints.begin(), endpoints.end(), std::back_inserter(keys),
                   [](const Endpoint &endpoint) { return endpoint.key; });
    return boost::join(keys, ", ");
}

/// Returns the word for several tenants in an address; empty if there is none.
std::string SharedTenantIn(const std::string &url) {
    for (const char *word : {"common", "organizations", "consumers"}) {
        if (boost::icontains(url, std::string("/") + word + '/')) {
            return word;
        }
    }
    return {};
}

/// Returns the first address of another tenant, or the end.
std::vector<Endpoint>::const_iterator FindOtherTenant(const std::vector<Endpoint> &endpoints,
                                                      const std::string &tenant) {
    return std::find_if(endpoints.begin(), endpoints.end(), [&](const Endpoint &endpoint) {
        const std::string found = TenantIn(endpoint.url);
        return !found.empty() && !boost::iequals(found, tenant);
    });
}

/// Returns the first address for several tenants, or the end.
std::vector<Endpoint>::const_iterator FindSharedTenant(const std::vector<Endpoint> &endpoints) {
    return std::find_if(endpoints.begin(), endpoints.end(),
                        [](const Endpoint &endpoint) { return !SharedTenantIn(endpoint.url).empty(); });
}

/// Reports the first address of another tenant.
bool ReportOtherTenant(Report &report, const std::vector<Endpoint> &endpoints, const std::string &tenant) {
    const auto other = FindOtherTenant(endpoints, tenant);
    if (other == endpoints.end()) {
        return false;
    }
    const std::string found = TenantIn(other->url);
    const bool isAlone = std::any_of(endpoints.begin(), endpoints.end(), [&](const Endpoint &endpoint) {
        return boost::iequals(TenantIn(endpoint.url), tenant);
    });
    report.Finding(
        kTenantID, kTenantSubject,
        other->key + " belongs to the tenant " + Quoted(found) + ", azure_tenant_id is " + Quoted(tenant),
        isAlone ? "Set " + other->key + " to " + Quoted(boost::ireplace_first_copy(other->url, found, tenant))
                : "Set azure_tenant_id to " + Quoted(boost::to_lower_copy(found)) +
                      ". If the users belong to the other tenant, copy its addresses from the provider instead.");
    return true;
}

/// Reports the first address for several tenants, if others are for one.
bool ReportSharedTenant(Report &report, const std::vector<Endpoint> &endpoints, const std::string &tenant) {
    const auto shared = FindSharedTenant(endpoints);
    if (shared == endpoints.end()) {
        return false;
    }
    const std::string word = SharedTenantIn(shared->url);
    report.Finding(kTenantID, kTenantSubject,
                   shared->key + " is for the users of several tenants: it contains " + Quoted(word) +
                       ". The library accepts the users of one",
                   IsGUID(tenant)
                       ? "Set " + shared->key + " to " +
                             Quoted(boost::ireplace_first_copy(shared->url, '/' + word + '/',
                                                               '/' + boost::to_lower_copy(tenant) + '/'))
                       : "Replace " + Quoted(word) + " in " + shared->key + " by the directory (tenant) ID.");
    return true;
}

void CheckTenant(Report &report, const std::vector<Endpoint> &endpoints, const std::string &tenant) {
    // Another tenant is reported with its key.
    const bool isUsable = IsGUID(tenant);
    if ((isUsable && ReportOtherTenant(report, endpoints, tenant)) || ReportSharedTenant(report, endpoints, tenant) ||
        !isUsable) {
        return;
    }
    const bool isNamed = std::any_of(endpoints.begin(), endpoints.end(),
                                     [&](const Endpoint &endpoint) { return boost::icontains(endpoint.url, tenant); });
    if (isNamed) {
        report.Good(kTenantID, kTenantSubject, "the addresses contain " + Quoted(tenant));
    } else {
        report.Note(kTenantID, kTenantSubject, "no address contains the tenant " + Quoted(tenant),
                    "Compare azure_tenant_id with the directory (tenant) ID at the provider.");
    }
}

bool IsVersion2(const Endpoint &endpoint) { return boost::icontains(endpoint.url, "/v2.0/"); }

std::string AddressOfVersion1(const std::string &url) { return boost::ireplace_first_copy(url, "/v2.0/", "/"); }

/// Azure AD has two versions of each endpoint. Tokens of one are not those of the other.
void CheckVersion(Report &report, const std::vector<Endpoint> &endpoints) {
    std::vector<Endpoint> version2;
    std::vector<Endpoint> version1;
    std::partition_copy(endpoints.begin(), endpoints.end(), std::back_inserter(version2), std::back_inserter(version1),
                        IsVersion2);
    if (version2.empty()) {
        return;
    }
    if (version1.empty()) {
        report.Note(
            kVersionID, kVersionSubject,
            R"(v2.0: a token may have no "unique_name". The library then reads the user's name from "email")",
            R"(At the provider, open "Token configuration" and add the optional claim "email" to the ID token. )"
            "The example front end also needs FRONTEND_ACCEPT_EMAIL=yes. Or use the v1 addresses.");
        return;
    }
    std::string remedy;
    for (const Endpoint &endpoint : version2) {
        remedy +=
            (remedy.empty() ? "Set " : ", and ") + endpoint.key + " to " + Quoted(AddressOfVersion1(endpoint.url));
    }
    report.Finding(kVersionID, kVersionSubject,
                   "mixed: " + KeysOf(version1) + (version1.size() == 1 ? " is" : " are") + " v1, " + KeysOf(version2) +
                       (version2.size() == 1 ? " is" : " are") + " v2.0",
                   remedy);
}

}  // namespace

std::string TenantOfAddresses(Client &client) {
    for (const Endpoint &endpoint : EndpointsOf(client)) {
        if (const std::string tenant = TenantIn(endpoint.url); !tenant.empty()) {
            return boost::to_lower_copy(tenant);
        }
    }
    return {};
}

bool DoAddressesAgree(Client &client) {
    const std::vector<Endpoint> endpoints = EndpointsOf(client);
    const std::string tenant = client.Azure()->GetTenantID();
    const bool isOther = IsGUID(tenant) && FindOtherTenant(endpoints, tenant) != endpoints.end();
    const auto version2 = std::count_if(endpoints.begin(), endpoints.end(), IsVersion2);
    return !isOther && FindSharedTenant(endpoints) == endpoints.end() &&
           (version2 == 0 || version2 == static_cast<std::ptrdiff_t>(endpoints.size()));
}

void CheckAzureAddresses(Report &report, Client &client) {
    const std::vector<Endpoint> endpoints = EndpointsOf(client);
    CheckTenant(report, endpoints, client.Azure()->GetTenantID());
    CheckVersion(report, endpoints);
}

void CheckTenantOfIssuer(Report &report, Client &client, const std::string &issuer) {
    constexpr char kID[] = "discovery.tenant";
    constexpr char kSubject[] = "tenant of the provider";
    const std::string tenant = client.Azure()->GetTenantID();
    if (!TenantOfAddresses(client).empty() && !boost::iequals(TenantOfAddresses(client), tenant)) {
        return;  // reported with the addresses
    }
    const std::string issued = FindGUID(issuer);
    // Azure AD writes identifiers in lower case.
    const std::string expected = issued.empty() && IsGUID(tenant) ? boost::to_lower_copy(tenant) : issued;
    if (expected.empty() || tenant.empty()) {
        return;
    }
    if (tenant == expected) {
        if (!issued.empty()) {
            report.Good(kID, kSubject, "as configured");
        }
        return;
    }
    const bool isCase = boost::iequals(tenant, expected);
    report.Finding(kID, kSubject,
                   "the provider writes " + Quoted(expected) + ", azure_tenant_id is " + Quoted(tenant) +
                       (isCase ? ". The library compares capitals, too" : ""),
                   "Set azure_tenant_id to " + Quoted(expected) +
                       (isCase || !IsGUID(tenant) ? "" : ", or azure_wellknown to the document of your tenant"));
}

}  // namespace Doctor
