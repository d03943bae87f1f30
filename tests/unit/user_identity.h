#ifndef TAVOSSO_TESTS_UNIT_USER_IDENTITY_H
#define TAVOSSO_TESTS_UNIT_USER_IDENTITY_H

#include "tests/support/encoding.h"
#include "tests/support/token.h"
#include "tests/unit/clients.h"
#include "tests/unit/fixture.h"

namespace Test {

/// Asks a client with a token for the user's name.
template <typename Client>
class Identity : public Library {
  protected:
    Failure NameOf(const std::string &claims) { return NameIn("e30." + Base64Url(claims) + "."); }

    Failure NameIn(const std::string &token) {
        client.token = token;
        return FailureOf([this] { client.GetUserName(userName); });
    }

    Client client;
    std::string userName = "before";
};

}  // namespace Test

#endif
