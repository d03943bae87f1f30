#ifndef TAVOSSO_TESTS_UNIT_CLIENTS_H
#define TAVOSSO_TESTS_UNIT_CLIENTS_H

#include "sso/sso.h"

// Both clients with public fields, so tests can set them.
namespace Test {

struct AzureClient : TAVO::SSO::AzureSSOClient {
    using AzureSSOClient::authEndpoint;
    using AzureSSOClient::clientID;
    using AzureSSOClient::clientSecret;
    using AzureSSOClient::code;
    using AzureSSOClient::logoutEndpoint;
    using AzureSSOClient::redirectURI;
    using AzureSSOClient::tenantID;
    using AzureSSOClient::token;
    using AzureSSOClient::wellknownEndpoint;

    static constexpr char kScope[] = "openid";
};

struct WebSphereClient : TAVO::SSO::WebSphereSSOClient {
    using WebSphereSSOClient::authEndpoint;
    using WebSphereSSOClient::clientID;
    using WebSphereSSOClient::clientSecret;
    using WebSphereSSOClient::code;
    using WebSphereSSOClient::redirectURI;
    using WebSphereSSOClient::token;

    static constexpr char kScope[] = "openid%20profile%20email";
};

}  // namespace Test

#endif
