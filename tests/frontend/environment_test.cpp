#include "frontend/environment.h"

#include <gmock/gmock.h>

#include <cstdlib>

#include "web/refusal.h"

using namespace Frontend;

namespace {

class Environment : public testing::Test {
  protected:
    ~Environment() override {
        unsetenv("FRONTEND_ACCEPT_EMAIL");
        unsetenv("FRONTEND_PENDING_LOGINS");
    }
};

TEST_F(Environment, AcceptsUnverifiedEmailOnlyIfSetToYes) {
    EXPECT_FALSE(AcceptsUnverifiedEmail());
    for (const char *value : {"no", "", "Yes", "1"}) {
        setenv("FRONTEND_ACCEPT_EMAIL", value, 1);
        EXPECT_FALSE(AcceptsUnverifiedEmail()) << value;
    }
    setenv("FRONTEND_ACCEPT_EMAIL", "yes", 1);
    EXPECT_TRUE(AcceptsUnverifiedEmail());
}

TEST_F(Environment, LimitsPendingLogins) {
    EXPECT_EQ(MostPendingLogins(), 1000U);
    setenv("FRONTEND_PENDING_LOGINS", "3", 1);
    EXPECT_EQ(MostPendingLogins(), 3U);
}

TEST_F(Environment, RejectsInvalidLimit) {
    for (const char *value : {"0", "-1", " 3", "3x", "many", "99999999999999999999999"}) {
        setenv("FRONTEND_PENDING_LOGINS", value, 1);
        EXPECT_THAT(MostPendingLogins,
                    testing::ThrowsMessage<TAVO::Web::Refusal>("FRONTEND_PENDING_LOGINS must be a number above 0."))
            << value;
    }
}

}  // namespace
