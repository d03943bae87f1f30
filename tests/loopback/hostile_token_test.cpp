#include <gmock/gmock.h>

#include <ostream>
#include <stdexcept>
#include <string>
#include <vector>

#include "jwt/jwt.h"
#include "sso/sso.h"
#include "tests/loopback/loopback_provider.h"
#include "tests/support/conversion.h"
#include "tests/support/encoding.h"
#include "tests/support/server.h"
#include "tests/support/system_log.h"
#include "tests/support/token.h"

// Correctly signed tokens with arbitrary content: each member with every JSON type, repeated, and huge.
namespace Test {

namespace {

using TAVO::JWT::jwt_not_support;
using TAVO::JWT::jwt_verify_failed;
using TAVO::SSO::sso_op_failed;
using ::testing::ElementsAreArray;
using ::testing::IsEmpty;
using ::testing::ValuesIn;

constexpr Profile kBoth[] = {Profile::kAzure, Profile::kWebSphere};
constexpr std::size_t kHuge = std::size_t{1} << 20;

Outcome Expired() { return Refused<std::invalid_argument>("id_token expired."); }
Outcome BadTenant() { return Refused<std::invalid_argument>("tenant ID invalid"); }
Outcome BadAudience() { return Refused<std::invalid_argument>("client ID invalid"); }
Outcome UnknownKey() { return Refused<std::invalid_argument>("kid does not exist in Azure verified kyes"); }
Outcome Unsupported(const std::string &algorithm) {
    return Refused<jwt_not_support>(algorithm + " algorithm is not supported");
}
Outcome NoUser() { return Refused<std::invalid_argument>("cannot find the user name!"); }
Outcome NoDomain(const std::string &user) { return Refused<std::invalid_argument>("cannot get the user name!", user); }

/// A token of these texts, signed by the provider.
std::string Sign(Profile profile, const std::string &header, const std::string &claims) {
    const std::string signingInput = Base64Url(header) + "." + Base64Url(claims);
    return signingInput + "." +
           (profile == Profile::kAzure ? ProviderKey().Sign(signingInput, EVP_sha256())
                                       : SignHMAC(signingInput, kSecret, EVP_sha256()));
}

std::string HeaderText(Profile profile) { return Compact(TokenHeader(profile)); }
std::string ClaimsText(Profile profile) { return Compact(TokenClaims(profile)); }

/// The object as JSON text, with `value` verbatim as its member `name`; without the member if `value` is empty.
std::string WithMember(Json::Value object, const std::string &name, const std::string &value) {
    object.removeMember(name);
    std::string text = Compact(object);
    return value.empty() ? text : text.insert(text.size() - 1, ",\"" + name + "\":" + value);
}

/// Repeats the member.
std::string Again(const std::string &first, const std::string &name, const std::string &second) {
    return first + ",\"" + name + "\":" + second;
}

std::string Quoted(const std::string &text) { return "\"" + text + "\""; }

struct ValueCase {
    std::string value;
    Outcome outcome;
    bool asksForKeys = true;  // the claims are accepted
    std::vector<LogLine> log = {};
};

ValueCase Early(const std::string &value, const Outcome &outcome) { return {value, outcome, false}; }

ValueCase NotConverted(const std::string &value, const std::string &user, const std::string &line) {
    return {value, Refused<sso_op_failed>("TAVOWinsUserNameFqdn2Netbios failed.", user), true, {Error(line)}};
}

struct MemberCase {
    std::string name;
    Profile profile;
    bool inHeader;
    std::string member;
    std::vector<ValueCase> values;
    std::string configuration = "{}";
};

void PrintTo(const MemberCase &row, std::ostream *stream) { *stream << row.name; }

void ExpectLogin(const MemberCase &row, const ValueCase &value) {
    const Json::Value header = TokenHeader(row.profile);
    const Json::Value claims = TokenClaims(row.profile);
    const std::string token = Sign(row.profile, WithMember(header, row.inHeader ? row.member : "", value.value),
                                   WithMember(claims, row.inHeader ? "" : row.member, value.value));
    Provider provider(row.profile, row.configuration);
    provider.AnswerLogin(token);
    EXPECT_EQ(provider.LogIn(), value.outcome);
    std::vector<std::string> requests = AllRequestLines(row.profile);
    requests.resize(value.asksForKeys ? requests.size() : 1);
    EXPECT_THAT(provider.RequestLines(), ElementsAreArray(requests));
    EXPECT_EQ(TakeSystemLog(), value.log);
}

class TokenMember : public ::testing::TestWithParam<MemberCase> {};

TEST_P(TokenMember, YieldsExpectedOutcome) {
    for (const ValueCase &value : GetParam().values) {
        SCOPED_TRACE(value.value.substr(0, 100));
        ExpectLogin(GetParam(), value);
    }
}

std::vector<ValueCase> ExpiryValues(const Outcome &accepted) {
    const std::string never = "9223372036854775807";
    return {
        {"1700000000.5", accepted},  // read up to the point
        {"1.7e9", accepted},
        {never, accepted},
        {"9223372036854775808", accepted},
        {Quoted(std::string(kHuge, '9')), accepted},
        {Quoted(" \\t+1700000000"), accepted},
        {Quoted("1700000000\\u00000"), accepted},
        {Again("1", "exp", "1700000000"), accepted},
        Early("null", Expired()),
        Early("true", Expired()),
        Early("false", Expired()),
        Early("\"\"", Expired()),
        Early(R"({"exp": 1700000000})", Expired()),
        Early("1699999999.9", Expired()),
        Early("1e300", Expired()),  // written as 1e+300
        Early("18446744073709551616", Expired()),
        Early("-9223372036854775809", Expired()),
        Early(Quoted("0x7fffffff"), Expired()),
        Early(Quoted("\\u00001700000000"), Expired()),
        Early(Quoted(std::string(kHuge, 'x')), Expired()),
        Early(Again("1700000000", "exp", "1"), Expired()),
        Early(Again("1700000000", "exp", "null"), Expired()),
    };
}

/// Values of a member that must equal this text.
std::vector<ValueCase> TextValues(const std::string &member, const std::string &text, const Outcome &accepted,
                                  const Outcome &refused) {
    return {
        {Again(Quoted("x"), member, Quoted(text)), accepted},
        {Quoted("\\u0074" + text.substr(1)), accepted},  // an escaped t
        Early("null", refused),
        Early("true", refused),
        Early("5", refused),
        Early("0.5", refused),
        Early("\"\"", refused),
        Early("{" + Quoted(text) + ": " + Quoted(text) + "}", refused),
        Early("[" + Quoted(text) + "]", refused),
        Early(Quoted(text + "\\u0000"), refused),
        Early(Quoted(text + std::string(kHuge, ' ')), refused),
        Early(Again(Quoted(text), member, Quoted("x")), refused),
        Early(Again(Quoted(text), member, "null"), refused),
    };
}

/// A value that is not a string is compared as text.
MemberCase TextOf(const std::string &name, Profile profile, const std::string &member, const std::string &value,
                  const std::string &text) {
    const std::string key = member == "tid"              ? "azure_tenant_id"
                            : profile == Profile::kAzure ? "azure_client_id"
                                                         : "websphere_client_id";
    const std::string configuration = "{" + Quoted(key) + ": " + Quoted(text) + "}";
    return {Name(profile) + name, profile, false, member, {{value, LoggedIn(UserName(profile))}}, configuration};
}

std::vector<MemberCase> Claims() {
    std::vector<MemberCase> rows;
    for (const Profile profile : kBoth) {
        const Outcome accepted = LoggedIn(UserName(profile));
        rows.push_back({Name(profile) + "Expiry", profile, false, "exp", ExpiryValues(accepted)});
        rows.push_back({Name(profile) + "Audience", profile, false, "aud",
                        TextValues("aud", "the client", accepted, BadAudience())});
        rows.push_back(TextOf("AudienceNumber", profile, "aud", "5", "5"));
        rows.push_back(TextOf("AudienceTrue", profile, "aud", "true", "true"));
        rows.push_back(TextOf("AudienceNull", profile, "aud", "null", ""));
        rows.push_back(TextOf("AudienceMissing", profile, "aud", "", ""));
        for (const char *unread : {"iss", "nbf", "iat", "nonce", "azp"}) {
            rows.push_back({Name(profile) + "UnreadMember_" + unread,
                            profile,
                            false,
                            unread,
                            {{"", accepted},
                             {"null", accepted},
                             {"9999999999", accepted},
                             {"{}", accepted},
                             {Quoted(std::string(kHuge, 'x')), accepted},
                             {Again("1", unread, "[]"), accepted}}});
        }
    }
    rows.push_back({"AzureTenant", Profile::kAzure, false, "tid",
                    TextValues("tid", "the tenant", LoggedIn(UserName(Profile::kAzure)), BadTenant())});
    rows.push_back(TextOf("TenantFraction", Profile::kAzure, "tid", "0.5", "0.5"));
    rows.push_back(TextOf("TenantFalse", Profile::kAzure, "tid", "false", "false"));
    rows.push_back(TextOf("TenantMissing", Profile::kAzure, "tid", "", ""));
    return rows;
}

std::vector<ValueCase> PrincipalNames(const std::string &member) {
    const Outcome alice = LoggedIn(R"(CORP\alice)");
    const std::string name = Quoted("alice@corp.example");
    const std::string huge(kHuge, 'u');
    const std::string tooLong(1024, 'u');
    const std::string doesNotFit = "platform:N name is too long for its buffer";
    return {
        {name, alice},
        {Again(Quoted("bob@corp.example"), member, name), alice},
        {Quoted("alice\\u0000x@corp.example"), alice},  // the platform reads up to the first NUL
        {"", NoUser()},
        {"null", NoUser()},
        {"true", NoUser()},
        {"5", NoUser()},
        {"0.5", NoUser()},
        {"{}", NoUser()},
        {"[" + name + "]", NoUser()},
        {Again(name, member, "5"), NoUser()},
        {"\"\"", NoDomain("")},
        {Quoted(huge), NoDomain(huge)},
        {Quoted(std::string(kHuge, '@')), NoDomain("")},
        NotConverted(Quoted("alice@"), "\\alice", EmptyDomain()),
        NotConverted(Quoted(tooLong + "@corp.example"), "CORP.EXAMPLE\\" + tooLong, doesNotFit),
        NotConverted(Quoted(huge + "@corp.example"), "CORP.EXAMPLE\\" + huge, doesNotFit),
    };
}

std::vector<MemberCase> Users() {
    const std::string huge(kHuge, 'u');
    // "unique_name" has precedence over "email", so each is tested without the other.
    return {
        {"AzureUniqueName", Profile::kAzure, false, "unique_name", PrincipalNames("unique_name")},
        {"WebSphereSubject",
         Profile::kWebSphere,
         false,
         "sub",
         {{"", NoUser()},
          {"null", NoUser()},
          {"true", NoUser()},
          {"0.5", NoUser()},
          {"{}", NoUser()},
          {R"(["alice"])", NoUser()},
          {Again(R"("alice")", "sub", "null"), NoUser()},
          {Again(R"("bob")", "sub", R"("alice")"), LoggedIn("alice")},
          {R"("alice\u0000x")", LoggedIn(std::string("alice\0x", 7))},
          {R"("\u000aalice")", LoggedIn("\nalice")},
          {Quoted(huge), LoggedIn(huge)}}},
    };
}

std::vector<ValueCase> AlgorithmValues(const std::string &own, const Outcome &accepted) {
    const std::string huge(kHuge, 'A');
    return {
        {Again(Quoted("none"), "alg", Quoted(own)), accepted},
        {"", Unsupported("")},
        {"null", Unsupported("")},
        {"\"\"", Unsupported("")},
        {"{}", Unsupported("")},
        {"[" + Quoted(own) + "]", Unsupported("")},
        {"true", Unsupported("true")},
        {"256", Unsupported("256")},
        {"0.5", Unsupported("0.5")},
        {Quoted(" " + own), Unsupported(" " + own)},
        {Quoted(huge), Unsupported(huge)},
        {Again(Quoted(own), "alg", Quoted("none")), Unsupported("none")},
        // The text of the exception ends at the NUL.
        {Quoted(own + "\\u0000"), Refused<jwt_not_support>(own)},
    };
}

std::vector<MemberCase> Headers() {
    std::vector<MemberCase> rows;
    for (const Profile profile : kBoth) {
        const bool azure = profile == Profile::kAzure;
        const Outcome accepted = LoggedIn(UserName(profile));
        rows.push_back(
            {Name(profile) + "Algorithm", profile, true, "alg", AlgorithmValues(azure ? "RS256" : "HS256", accepted)});
        for (const char *unread : {"typ", "cty", "crit", "b64", "zip"}) {
            rows.push_back({Name(profile) + "UnreadMember_" + unread,
                            profile,
                            true,
                            unread,
                            {{"", accepted},
                             {"null", accepted},
                             {"false", accepted},
                             {R"(["exp"])", accepted},
                             {Quoted(std::string(kHuge, 'x')), accepted}}});
        }
    }
    rows.push_back({"AzureKeyName",
                    Profile::kAzure,
                    true,
                    "kid",
                    {{"", UnknownKey()},
                     {"null", UnknownKey()},
                     {"true", UnknownKey()},
                     {"5", UnknownKey()},
                     {"{}", UnknownKey()},
                     {R"(["first key"])", UnknownKey()},
                     {R"("first key\u0000")", UnknownKey()},
                     {R"("First Key")", UnknownKey()},
                     {Quoted(std::string(kHuge, 'k')), UnknownKey()},
                     {Again(R"("first key")", "kid", R"("second key")"), UnknownKey()},
                     {Again(R"("second key")", "kid", R"("first key")"), LoggedIn(UserName(Profile::kAzure))}}});
    rows.push_back({"WebSphereKeyName",
                    Profile::kWebSphere,
                    true,
                    "kid",
                    {{"5", LoggedIn("alice")}, {"{}", LoggedIn("alice")}, {R"("any")", LoggedIn("alice")}}});
    return rows;
}

std::string NameOfMember(const ::testing::TestParamInfo<MemberCase> &info) { return info.param.name; }

INSTANTIATE_TEST_SUITE_P(Claim, TokenMember, ValuesIn(Claims()), NameOfMember);
INSTANTIATE_TEST_SUITE_P(User, TokenMember, ValuesIn(Users()), NameOfMember);
INSTANTIATE_TEST_SUITE_P(Header, TokenMember, ValuesIn(Headers()), NameOfMember);

class TokenJSON : public ::testing::TestWithParam<Profile> {
  protected:
    static void ExpectLogin(const std::string &header, const std::string &claims, const Outcome &outcome) {
        SCOPED_TRACE(header.substr(0, 100) + " . " + claims.substr(0, 100));
        Provider provider(GetParam());
        provider.AnswerLogin(Sign(GetParam(), header, claims));
        EXPECT_EQ(provider.LogIn(), outcome);
        EXPECT_THAT(TakeSystemLog(), IsEmpty());
    }

    const std::string header_ = HeaderText(GetParam());
    const std::string claims_ = ClaimsText(GetParam());
    const Outcome accepted_ = LoggedIn(UserName(GetParam()));
};

INSTANTIATE_TEST_SUITE_P(With, TokenJSON, ValuesIn(kBoth), [](const auto &row) { return Name(row.param); });

TEST_P(TokenJSON, HasNoMembersUnlessObject) {
    const Outcome noAlgorithm = GetParam() == Profile::kAzure ? UnknownKey() : Unsupported("");
    for (const char *text : {"null", "true", "5", "0.5", R"("alg")", "[]", R"([{"alg": "HS256"}])"}) {
        ExpectLogin(text, claims_, noAlgorithm);
        ExpectLogin(header_, text, Expired());
    }
}

TEST_P(TokenJSON, AllowsCommentsAndTrailingText) {
    for (const std::string &trailing :
         {std::string(" \n\t"), std::string("// more"), std::string("/* more */"), std::string("}}"),
          std::string("{\"exp\": 1}"), std::string("\0{]", 3), std::string(kHuge, ' ')}) {
        ExpectLogin(header_ + trailing, claims_, accepted_);
        ExpectLogin(header_, claims_ + trailing, accepted_);
    }
    ExpectLogin("/* less */ \n" + header_, "// less\n" + claims_, accepted_);
}

TEST_P(TokenJSON, RejectsInvalidJSON) {
    const Outcome badHeader = Refused<std::invalid_argument>("bad jwt header format!");
    const Outcome badBody = Refused<std::invalid_argument>("bad jwt body format!");
    const std::string deep = "{\"a\":" + std::string(2000, '[') + std::string(2000, ']') + ",";
    for (const std::string &before : {std::string("\0", 1), std::string("x"), std::string("\xef\xbb\xbf"), deep}) {
        const auto spoilt = [&](const std::string &text) { return before + (before == deep ? text.substr(1) : text); };
        ExpectLogin(spoilt(header_), claims_, badHeader);
        ExpectLogin(header_, spoilt(claims_), badBody);
    }
}

TEST(AzureHeader, IgnoresEmbeddedKey) {
    const RSAKey own;
    Json::Value header = TokenHeader(Profile::kAzure);
    header["jwk"] = own.JWK(kKeyID);
    const std::string signingInput = SigningInput(header, TokenClaims(Profile::kAzure));
    Provider provider(Profile::kAzure);
    provider.AnswerLogin(signingInput + "." + own.Sign(signingInput, EVP_sha256()));
    EXPECT_EQ(provider.LogIn(), Refused<jwt_verify_failed>("verify rsa signature failed"));
    EXPECT_THAT(TakeSystemLog(), ElementsAreArray({Error("jwt:N EVP_DigestVerifyFinal failed")}));
}

TEST(AzureHeader, IgnoresKeySetAddress) {
    const RSAKey own;
    Server elsewhere;
    Json::Value header = TokenHeader(Profile::kAzure);
    for (const char *name : {"jku", "x5u"}) {
        header[name] = elsewhere.URL("/keys");
    }
    const std::string signingInput = SigningInput(header, TokenClaims(Profile::kAzure));
    Provider provider(Profile::kAzure);
    provider.AnswerLogin(signingInput + "." + own.Sign(signingInput, EVP_sha256()));
    EXPECT_EQ(provider.LogIn(), Refused<jwt_verify_failed>("verify rsa signature failed"));
    EXPECT_THAT(provider.RequestLines(), ElementsAreArray(AllRequestLines(Profile::kAzure)));
    EXPECT_THAT(elsewhere.Requests(), IsEmpty());
}

}  // namespace

}  // namespace Test
