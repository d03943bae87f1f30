#include "web/configured_profile.h"

#include <gmock/gmock.h>
#include <sso/supported_profiles.h>

#include <filesystem>
#include <fstream>

#include "web/refusal.h"
#include "web/text.h"

using namespace TAVO::Web;

namespace {

constexpr char kSettings[] = "/usr/tavo/etc/ssoclient/";

class Profile : public testing::Test {
  protected:
    Profile() { std::filesystem::create_directories(kSettings); }
    ~Profile() override { std::filesystem::remove_all("/usr/tavo/etc"); }

    static void Write(const std::string &name, const std::string &text) { std::ofstream(kSettings + name) << text; }

    static void WriteClient(const std::string &name, const std::string &without) {
        Json::Value settings;
        for (const char *key :
             {"client_id", "client_secret", "redirect_uri", "authorization_endpoint", "token_endpoint", "wellknown"}) {
            if (key != without) {
                settings[name + "_" + key] = "given";
            }
        }
        Write(name + ".conf", WriteCompact(settings));
    }
};

/// The class and text of the exception that `choose` throws; empty if none.
template <typename Choose>
std::string Failure(Choose choose) {
    try {
        choose();
    } catch (const TAVO::SSO::sso_op_failed &failure) {
        return std::string("sso_op_failed ") + failure.what();
    } catch (const TAVO::SSO::sso_exception &failure) {
        return std::string("sso_exception ") + failure.what();
    }
    return "";
}

std::string OwnFailure() { return Failure(RequireSettings); }

std::string FailureOfOIDCLogin() {
    return Failure([] {
        std::string user;
        TAVO::SSO::OIDCLogin("a code", user);
    });
}

TEST_F(Profile, FailsLikeOIDCLogin) {
    for (const char *text :
         {"{}", "{\"sso_profile\":\"azure\"}", "{\"sso_enable\":false,\"sso_profile\":\"azure\"}",
          "{\"sso_enable\":\"true\",\"sso_profile\":\"azure\"}", "{\"sso_enable\":true,\"sso_profile\":\"Azure\"}",
          "{\"sso_enable\":true,\"sso_profile\":\"\"}"}) {
        Write("profile.conf", text);
        EXPECT_NE(OwnFailure(), "") << text;
        EXPECT_EQ(OwnFailure(), FailureOfOIDCLogin()) << text;
    }
}

TEST_F(Profile, FailsForMissingKeys) {
    EXPECT_EQ(OwnFailure(), "sso_op_failed sso does not enable.");
    Write("profile.conf", "{\"sso_enable\":true}");
    EXPECT_EQ(OwnFailure(), "sso_exception profile not support.");
}

TEST_F(Profile, SelectsClient) {
    WriteClient("azure", "nothing");
    WriteClient("websphere", "nothing");
    Write("websphere.conf", "{\"websphere_client_id\":\"of websphere\"}");
    for (const auto &[name, id] : {std::pair("azure", "given"), std::pair("websphere", "of websphere")}) {
        Write("profile.conf", std::string("{\"sso_enable\":true,\"sso_profile\":\"") + name + "\"}");
        EXPECT_EQ(TAVO::SSO::WithClient(name, [](TAVO::SSO::SSOClient &client) { return client.GetClientID(); }), id);
    }
}

TEST_F(Profile, IsCompleteIfNoKeyIsMissing) {
    EXPECT_EQ(HowFarSetUp(), SetUp::kOff);
    for (const std::string name : {"azure", "websphere"}) {
        Write("profile.conf", "{\"sso_enable\":true,\"sso_profile\":\"" + name + "\"}");
        EXPECT_EQ(HowFarSetUp(), SetUp::kIncomplete);
        WriteClient(name, "nothing");
        EXPECT_EQ(HowFarSetUp(), SetUp::kComplete);
        for (const char *key :
             {"client_id", "client_secret", "redirect_uri", "authorization_endpoint", "token_endpoint"}) {
            WriteClient(name, key);
            EXPECT_EQ(HowFarSetUp(), SetUp::kIncomplete) << key;
        }
    }
    Write("profile.conf", "{\"sso_enable\":true,\"sso_profile\":\"another\"}");
    EXPECT_EQ(HowFarSetUp(), SetUp::kIncomplete);
}

TEST_F(Profile, RequiresCompleteSettings) {
    WriteClient("websphere", "nothing");
    Write("profile.conf", "{\"sso_enable\":true,\"sso_profile\":\"websphere\"}");
    EXPECT_EQ(WriteCompact(RequireSettings()),
              R"({"client_id":"given","profile":"websphere","token_endpoint":"given"})");
    WriteClient("websphere", "client_secret");
    EXPECT_THAT(RequireSettings,
                testing::ThrowsMessage<Refusal>("Single sign-on is not completely set up on this device."));
}

TEST_F(Profile, RequiresDiscoveryURLOnlyForAzure) {
    for (const auto &[name, expected] :
         {std::pair("azure", SetUp::kIncomplete), std::pair("websphere", SetUp::kComplete)}) {
        Write("profile.conf", std::string("{\"sso_enable\":true,\"sso_profile\":\"") + name + "\"}");
        WriteClient(name, "wellknown");
        EXPECT_EQ(HowFarSetUp(), expected);
    }
}

}  // namespace
