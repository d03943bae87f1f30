// The user's name in the claims of an ID token, for both clients. An input is accepted if either client returns a name.
#include <algorithm>
#include <stdexcept>

#include "sso/sso.h"
#include "tests/fuzz/domains.h"
#include "tests/fuzz/oracle.h"
#include "tests/fuzz/target.h"
#include "tests/fuzz/token_oracle.h"
#include "tests/support/encoding.h"
#include "tests/support/token.h"

namespace Fuzz {

namespace {

constexpr std::size_t kLongestName = 1023;

Json::Value Claims(const std::string &part) {
    const ExpectedPart claims = ReadPart(part, "bad jwt body format!");
    if (part.empty()) {
        throw std::logic_error("empty jwt part");
    }
    if (!(claims.failure == Test::kNothingThrown)) {
        throw std::invalid_argument("bad jwt body format!");
    }
    return claims.value;
}

struct WebSphere : TAVO::SSO::WebSphereSSOClient {
    using WebSphereSSOClient::token;

    static void Expected(const std::string &part, std::string &userName, std::vector<std::string> & /*log*/) {
        const std::optional<std::string> name = StringMember(Claims(part), "sub");
        if (!name) {
            throw std::invalid_argument("cannot find the user name!");
        }
        userName = *name;
    }
};

struct Azure : TAVO::SSO::AzureSSOClient {
    using AzureSSOClient::token;

    static void Expected(const std::string &part, std::string &userName, std::vector<std::string> &log) {
        const Json::Value claims = Claims(part);
        const std::optional<std::string> unique = StringMember(claims, "unique_name");
        const std::optional<std::string> principal = unique ? unique : StringMember(claims, "email");
        if (!principal) {
            throw std::invalid_argument("cannot find the user name!");
        }
        std::vector<std::string> pieces = Split(*principal, '@');
        userName = pieces[0];
        if (pieces.size() != 2) {
            throw std::invalid_argument("cannot get the user name!");
        }
        for (char &c : pieces[1]) {
            c = c >= 'a' && c <= 'z' ? static_cast<char>(c - 'a' + 'A') : c;
        }
        userName = pieces[1] + "\\" + pieces[0];
        const Conversion conversion = ToNetBIOS(userName, kLongestName);
        log = Lines(conversion);
        if (!conversion.name) {
            throw TAVO::SSO::sso_op_failed("TAVOWinsUserNameFqdn2Netbios failed.");
        }
        userName = *conversion.name;
    }
};

template <typename Client>
bool Names(const std::string &part) {
    Client client;
    client.token = "e30." + part + ".";
    std::string userName = "unchanged";
    const Test::Failure failure = FailureOf([&] { client.GetUserName(userName); });
    std::string expected = "unchanged";
    std::vector<std::string> log;
    RequireSame(failure, Test::FailureOf([&] { Client::Expected(part, expected, log); }));
    Require(userName == expected, "unexpected user name");

    Json::Value info = "unchanged";
    Json::Value claims = "unchanged";
    RequireSame(FailureOf([&] { client.GetUserInfo(info); }), Test::FailureOf([&] { claims = Claims(part); }));
    Require(info == claims, "unexpected claims");
    RequireLog(log);
    return failure == Test::kNothingThrown;
}

}  // namespace

bool Accepts(const std::string &input) {
    WriteDomainTable();
    const std::string part = Test::Base64Url(input);
    const bool azure = Names<Azure>(part);
    const bool webSphere = Names<WebSphere>(part);
    return azure || webSphere;
}

}  // namespace Fuzz
