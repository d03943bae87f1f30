// GetUserName and GetUserInfo of both clients.
#include "tests/unit/user_identity.h"

namespace Test {

namespace {

template <typename Client>
class UserIdentity : public Identity<Client> {
  protected:
    /// The exceptions of GetUserName and GetUserInfo for this token.
    std::vector<Failure> FailuresOf(const std::string &token) {
        const Failure nameFailure = this->NameIn(token);
        return {nameFailure, FailureOf([this] { this->client.GetUserInfo(info); })};
    }

    void TearDown() override {
        EXPECT_EQ(this->userName, "before");
        EXPECT_EQ(info, "before");
        Library::TearDown();
    }

    Json::Value info = "before";
};

using Clients = testing::Types<AzureClient, WebSphereClient>;
TYPED_TEST_SUITE(UserIdentity, Clients);

TYPED_TEST(UserIdentity, RequiresToken) {
    EXPECT_THAT(this->FailuresOf(""), testing::Each(Fails<std::invalid_argument>("please request a id_token first.")));
}

TYPED_TEST(UserIdentity, RejectsTokenUnlessThreeParts) {
    EXPECT_THAT(this->FailuresOf("a.b"), testing::Each(Fails<std::invalid_argument>("bad jwt format!")));
}

TYPED_TEST(UserIdentity, RejectsBodyUnlessJSON) {
    EXPECT_THAT(this->FailuresOf("e30." + Base64Url("no JSON") + ".c2ln"),
                testing::Each(Fails<std::invalid_argument>("bad jwt body format!")));
}

TYPED_TEST(UserIdentity, ThrowsLogicErrorForEmptyBody) {
    EXPECT_THAT(this->FailuresOf("e30..c2ln"),
                testing::Each(testing::Field(&Failure::type, typeid(std::logic_error).name())));
}

TYPED_TEST(UserIdentity, ReturnsAllClaimsUnverified) {
    this->client.token = "no header." + Base64Url(R"({"sub": "1", "exp": 1, "list": [1]})") + ".no signature";
    Json::Value claims;
    this->client.GetUserInfo(claims);
    EXPECT_EQ(claims, Parse(R"({"sub": "1", "exp": 1, "list": [1]})"));
}

}  // namespace

}  // namespace Test
