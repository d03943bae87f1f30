#include <gmock/gmock.h>

#include <string>
#include <utility>

#include "sso/sso.h"
#include "tests/doctor/appliance.h"
#include "tests/doctor/doctor_process.h"
#include "tests/doctor/login_dialogue.h"
#include "tests/support/encoding.h"
#include "tests/support/files.h"
#include "tests/support/token.h"

// For any response of a provider and any file content, the doctor terminates, prints no secret and controls no
// terminal. `RunDoctor` verifies the output of each run.
namespace Test {

namespace {

using ::testing::HasSubstr;

constexpr char kNasty[] = "before \x1b[2J\x1b]0;title\x07 \b\r\n \x7f \xc2\x9b[31m \x9b[31m behind";

std::string NastyJSON() { return Json::valueToQuotedString(kNasty); }

std::string FormOf(const std::string &request) { return request.substr(request.find("\r\n\r\n") + 4); }

Json::Value ErrorAnswer(const std::string &error, const std::string &description) {
    Json::Value answer;
    answer["error"] = error;
    answer["error_description"] = description;
    return answer;
}

class Output : public ::testing::TestWithParam<Profile> {
  protected:
    Appliance appliance{GetParam()};
};

INSTANTIATE_TEST_SUITE_P(Doctor, Output, ::testing::Values(Profile::kAzure, Profile::kWebSphere),
                         [](const auto &profile) { return Name(profile.param); });

TEST_P(Output, HidesSecretInEchoedRequest) {
    for (const bool isDecoded : {false, true}) {
        // A cut secret must not be printed either.
        for (std::size_t before = 0; before <= 200; before += 8) {
            appliance.AnswerAt("/token_endpoint", [=](const std::string &request) {
                const std::string form = isDecoded ? PercentDecode(FormOf(request)) : FormOf(request);
                return HTTPAnswer(Compact(ErrorAnswer("invalid_client", std::string(before, '.') + form)));
            });
            EXPECT_NE(RunDoctor({}).output, "");
        }
    }
}

TEST_P(Output, HidesSecretInProviderError) {
    for (const char *path : {"/token_endpoint", "/discovery", "/keys"}) {
        appliance.AnswerAt(path, Compact(ErrorAnswer(kClientSecret, kClientSecret)));
    }
    EXPECT_EQ(Ask({}).Find("token_endpoint.client", "note").found, "The provider refused: [hidden] ([hidden])");
}

TEST_P(Output, HidesSecretInOtherKey) {
    for (const char *key : {"client_id", "wellknown", "token_endpoint", "authorization_endpoint", "redirect_uri"}) {
        SCOPED_TRACE(key);
        Appliance other(GetParam());
        other.SetClient(key, std::string("https://127.0.0.1/") + kClientSecret);
        EXPECT_FALSE(Ask({}).checks.empty());
    }
}

TEST_P(Output, HidesTheShortestSecret) {
    for (const auto &[secret, isHidden] : {std::pair("Xq7#vK", true), std::pair("Xq7#v", false)}) {
        Appliance other(GetParam());
        other.SetClient("client_secret", secret);
        other.RefuseCodes("invalid_client", std::string("before ") + secret + " behind");
        const std::string found = Ask({}).Find("token_endpoint.client", "finding").found;
        EXPECT_EQ(found.find(secret) == std::string::npos, isHidden) << found;
        EXPECT_EQ(found.find("before [hidden] behind") != std::string::npos, isHidden) << found;
    }
}

TEST_P(Output, HidesSecretsBeforeCutting) {
    for (std::size_t before = 940; before < 1000; before += 3) {
        appliance.RefuseCodes("invalid_client", std::string(before, '.') + kClientSecret);
        EXPECT_NE(AskMachine({}).Find("token_endpoint.client", "finding").id, "");
    }
}

TEST_P(Output, HidesClaimsAndSignatureAlone) {
    const std::string token = appliance.Token();
    const std::size_t claims = token.find('.') + 1;
    const std::size_t signature = token.rfind('.') + 1;
    for (const std::string &part : {token.substr(claims, signature - claims - 1), token.substr(signature)}) {
        appliance.SetClient("client_id", part);
        EXPECT_THAT(Ask({"token", "-"}, token).Find("token.audience", "finding").found, HasSubstr("[hidden]"));
    }
}

TEST_P(Output, RemovesInvisibleCharacters) {
    // Both ends of each range of invisible and bidirectional characters, and their printable neighbours.
    const std::string invisible[] = {"\x1f",   "\x7f",   "\xc2\x80", "\xc2\x9f", "\u00ad",     "\u061c",    "\u180e",
                                     "\u200b", "\u200f", "\u2028",   "\u2029",   "\u202a",     "\u202e",    "\u2060",
                                     "\u206f", "\ufeff", "\ufff9",   "\ufffb",   "\U000e0000", "\U000e007f"};
    const std::string printable[] = {"\u00a0", "\u00ac", "\u00ae", "\u2010", "\u2027", "\u202f", "\u2070"};
    std::string description;
    for (const std::string &character : invisible) {
        description += character + '.';
    }
    for (const std::string &character : printable) {
        description += character;
    }
    appliance.RefuseCodes("invalid_client", description);
    const std::string output = RunDoctor({}).output;
    for (const std::string &character : invisible) {
        EXPECT_EQ(output.find(character), std::string::npos) << ::testing::PrintToString(character);
    }
    for (const std::string &character : printable) {
        EXPECT_NE(output.find(character), std::string::npos) << ::testing::PrintToString(character);
    }
}

TEST_P(Output, HidesCodeInResponse) {
    appliance.AnswerAt("/token_endpoint", [](const std::string &request) {
        const std::string form = PercentDecode(FormOf(request));
        return HTTPAnswer(Compact(ErrorAnswer("invalid_grant", std::string(100, '.') + form)));
    });
    EXPECT_EQ(WalkLogin().FirstFinding().subject, "exchange of the code");

    LoginDialogue dialogue;
    const std::string description = std::string(150, '.') + TAVO::SSO::URLEncode(kCode);
    EXPECT_EQ(dialogue.Paste(dialogue.ReturnAddress(kCode) + "&error=access_denied&error_description=" + description)
                  .FirstFinding()
                  .subject,
              "answer of the provider");
}

TEST_P(Output, HidesTokenInConfiguration) {
    appliance.SetClient("client_id", appliance.Token());
    EXPECT_THAT(Ask({"token", "-"}, appliance.Token()).Find("token.audience", "finding").found,
                HasSubstr("client_id is \"[hidden]\""));
}

TEST_P(Output, RemovesControlCharactersOfProviders) {
    for (const char *member : {"issuer", "jwks_uri", "authorization_endpoint", "token_endpoint", "end_session_endpoint",
                               "id_token_signing_alg_values_supported", "token_endpoint_auth_methods_supported"}) {
        Appliance other(GetParam());
        const bool isList = std::string(member).find("supported") != std::string::npos;
        other.ChangeDiscovery("{\"" + std::string(member) + "\": " + (isList ? "[" + NastyJSON() + "]" : NastyJSON()) +
                              "}");
        EXPECT_NE(RunDoctor({"--verbose"}).output, "") << member;
    }
    for (const char *member : {"kid", "kty", "alg", "n", "e"}) {
        Appliance other(GetParam());
        other.AnswerAt("/keys", KeySet("{\"" + std::string(member) + "\": " + NastyJSON() + "}"));
        EXPECT_NE(Ask({}).status, 2) << member;
        EXPECT_NE(Ask({"token", "-", "--fetch"}, other.Token()).status, 2) << member;
    }
    Appliance other(GetParam());
    for (const char *path : {"/token_endpoint", "/discovery", "/keys"}) {
        other.AnswerAt(path, Compact(ErrorAnswer(kNasty, kNasty)));
    }
    EXPECT_NE(Ask({}).status, 2);
}

TEST_P(Output, RemovesControlCharactersOfFiles) {
    for (const char *key : {"client_id", "tenant_id", "wellknown", "token_endpoint", "authorization_endpoint",
                            "redirect_uri", "client_secret", kNasty}) {
        Appliance other(GetParam());
        other.SetClient(key, kNasty);
        EXPECT_NE(Ask({}).status, 2) << key;  // an unusable key is not an error of the command
        EXPECT_EQ(RunDoctor({"login"}).status, 2) << key;
    }
    WriteFile(kProfileFile, "{\"sso_enable\": true, " + NastyJSON() + ": 1, \"sso_profile\": " + NastyJSON() + "}");
    EXPECT_EQ(Ask({}).status, 1);
    WriteFile(kProfileFile, kNasty);
    EXPECT_EQ(Ask({}).status, 1);
}

TEST_P(Output, RemovesControlCharactersOfTokens) {
    for (const char *member : {"aud", "tid", "sub", "unique_name", "exp"}) {
        appliance.GiveToken("{}", "{\"" + std::string(member) + "\": " + NastyJSON() + "}");
        EXPECT_NE(Ask({"token", "-", "--fetch"}, appliance.Token()).status, 2) << member;
    }
    for (const char *member : {"alg", "kid"}) {
        appliance.GiveToken("{\"" + std::string(member) + "\": " + NastyJSON() + "}", "{}");
        EXPECT_NE(Ask({"token", "-", "--fetch"}, appliance.Token()).status, 2) << member;
    }
}

TEST_P(Output, RemovesControlCharactersOfReturnAddress) {
    LoginDialogue dialogue;
    EXPECT_EQ(dialogue.Paste(std::string(kReturnURI) + "?error=%1b%5b2J&error_description=%07%c2%9b31m").status, 1);
}

TEST_P(Output, IsCompleteForAnyResponse) {
    constexpr char kZeros[] = "{\"error\": \"a\0b\", \"issuer\": \"\\u0000\"}\0";
    const std::string answers[] = {
        "",
        "null",
        "[]",
        "7",
        "\"text\"",
        "{",
        std::string(100000, '['),
        R"({"error": {"error": []}, "error_description": 7, "keys": {}, "jwks_uri": [], "issuer": {}})",
        R"({"keys": [null, 1, [], {}, {"kid": 1}, {"kid": "a", "n": "", "e": ""}, {"kid": "b", "n": "!", "e": "AQAB"}]})",
        std::string(kZeros, sizeof kZeros),
        "{\"error\": \"\xff\xfe\", \"jwks_uri\": \"\xff\"}",
        "{\"error\": \"" + std::string(30 << 20, 'x') + "\"}",
    };
    for (const std::string &answer : answers) {
        SCOPED_TRACE(answer.substr(0, 40));
        for (const char *path : {"/discovery", "/keys", "/token_endpoint"}) {
            Appliance other(GetParam());
            other.AnswerAt(path, answer);
            const Report report = Ask({});
            EXPECT_LT(report.json.toStyledString().size(), 20000U);
        }
    }
}

TEST_P(Output, IsCompleteForAnyKeySet) {
    for (const char *changes :
         {R"({"n": "AQ"})", R"({"n": "AAAA", "e": "AA"})", R"({"n": 7, "e": []})", R"({"kid": []})", R"({"kid": 7})",
          R"({"n": "%%%%"})", R"({"e": ""})", R"({"kty": {}, "alg": 1})"}) {
        appliance.AnswerAt("/keys", KeySet(changes));
        EXPECT_NE(Ask({}).status, 2) << changes;
        EXPECT_NE(Ask({"token", "-", "--fetch"}, appliance.Token()).status, 2) << changes;
    }
}

}  // namespace

}  // namespace Test
