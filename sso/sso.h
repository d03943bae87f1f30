/**
 * @mainpage Reference
 *
 * The relying party of the authorization-code flow (OpenID Connect Core 1.0, section 3.1) for the appliance's web front
 * end.
 *
 * A login takes two requests of the browser:
 *  1. Start: put a random value into the state and into a cookie. Construct the client of the configured profile and
 *     redirect the browser to the URL that `GetAccessTokenReqURI` returns.
 *  2. Return: the provider sends the browser to the redirect URI with a code and the state. Compare the state with the
 *     cookie. Call `OpenIDConnectLogin` with the code. Compare the ID token's "nonce" (`GetUserInfo`) with the nonce of
 *     the start. Then open a session.
 *
 * @warning The library keeps nothing between requests and checks neither cookie nor nonce. Without the cookie, an
 * attacker can sign a victim's browser in to the attacker's account. Without the nonce, an attacker can sign in with a
 * stolen code.
 *
 * Failures are exceptions. The texts of `what()` are fixed, including misspellings. Any function may throw
 * `std::bad_alloc`. Log lines begin with "SOURCE:LINE ".
 *
 * Use the library in one thread at a time. Constructing a client or a profile changes the effective ids of the process
 * while it reads a file. Each HTTP request initialises and cleans up libcurl globally; over TLS, libcurl also clears
 * the calling thread's OpenSSL error queue, including marks.
 *
 * The layout of the classes and the order of their virtual functions are fixed under soname `libtavosso.so.6`.
 */

/**
 * @file
 * Clients of the two providers, the profile, the login, and its exceptions.
 */
#ifndef TAVOSSO_SSO_SSO_H
#define TAVOSSO_SSO_SSO_H

#include <json/json.h>

#include <cstddef>
#include <stdexcept>
#include <string>

#pragma GCC visibility push(default)

/** Single sign-on through an OpenID Connect provider. */
namespace TAVO::SSO {

/**
 * Base class of the failures of single sign-on. Only `OIDCLogin` throws exactly this class, for an unsupported profile.
 */
class sso_exception : public std::runtime_error {
  public:
    /** @param message  the text of `what()` */
    explicit sso_exception(std::string message);
    ~sso_exception() override;
};

/**
 * A transfer failed (`what()` is libcurl's text), or the provider's response cannot be used. For an error response of
 * Azure, `what()` is the whole response: do not show it or log it.
 */
class sso_err_resp : public sso_exception {
  public:
    /** @param message  the text of `what()` */
    explicit sso_err_resp(std::string message);
    ~sso_err_resp() override;
};

/** A step of the login was called on the base client, which supports no provider. */
class sso_not_implemented : public sso_exception {
  public:
    /** @param message  the text of `what()` */
    explicit sso_not_implemented(std::string message);
    ~sso_not_implemented() override;
};

/** An operation on this machine failed: reading the profile, encoding, or converting a domain. */
class sso_op_failed : public sso_exception {
  public:
    /** @param message  the text of `what()` */
    explicit sso_op_failed(std::string message);
    ~sso_op_failed() override;
};

/**
 * Base class of the clients: settings, requests to the provider, and the order of a login. Use each object for one
 * login only. Derived classes implement the functions that throw `sso_not_implemented` here.
 *
 * It has no virtual destructor. Deleting a client through a pointer to this class is undefined behaviour:
 * @code
 * std::unique_ptr<TAVO::SSO::SSOClient> client = std::make_unique<TAVO::SSO::AzureSSOClient>();  // forbidden
 * TAVO::SSO::AzureSSOClient client;                                                             // use this
 * @endcode
 */
class SSOClient {
  public:
    /**
     * Returns whether the client's file enables the client. Does not affect logins.
     * @return "azure_sso_enable"; false for WebSphere, whose file has no such key
     */
    virtual bool isEnable();
    /** Returns the client identifier (RFC 6749, section 2.2). @return as configured */
    virtual std::string GetClientID();
    /** Returns the client secret. Never show it or log it. @return as configured */
    virtual std::string GetClientSecret();
    /** Returns the redirect URI. @return as configured, or as set by `SetRedirectURI` */
    virtual std::string GetRedirectURI();
    /** Returns the ID token. @return the compact form; empty unless `ProcessTokenResponse` succeeded */
    virtual std::string GetToken();
    /** Returns the authorization endpoint. @return as configured */
    virtual std::string GetAuthEndpoint();
    /** Returns the token endpoint. @return as configured */
    virtual std::string GetTokenEndpoint();
    /** Returns the URL of the discovery document. @return as configured */
    virtual std::string GetWellknownEndpoint();
    /** Returns the logout endpoint. @return as configured */
    virtual std::string GetLogoutEndpoint();
    /** Replaces the redirect URI. @param uri  not checked */
    virtual void SetRedirectURI(std::string uri);
    /** Stores the authorization code. @param authorizationCode  percent-decoded; not checked */
    virtual void SetCode(std::string authorizationCode);

    /**
     * Fetches the discovery document (OpenID Connect Discovery 1.0, section 4). Verifies certificate and host name.
     *
     * @param out  receives the document; null if it is not JSON; unchanged if the transfer fails or memory runs out
     *
     * Does not throw. Logs a failure at `LOG_ERR`:
     *  - "sso:LINE TEXT": libcurl's text, or "bad wellknown json format.";
     *  - "sso:LINE bad_alloc. SYSTEM TEXT": memory ran out outside the transfer.
     *
     * Side effects: those of `httpGet`.
     */
    virtual void RequestWellknownInfo(Json::Value &out);

    /**
     * Sends the token request (RFC 6749, section 4.1.3). Verifies certificate and host name.
     *
     * @param response  the response is appended to it, whatever the HTTP status. After a failed transfer, this is the
     *                  part that arrived. Each chunk is cut at its first NUL
     * @param body      as returned by `GetIDTokenReqParams`
     *
     * Does not throw. Logs a failure at `LOG_ERR`:
     *  - "sso:LINE request token uri TEXT.": libcurl's text;
     *  - "sso:LINE bad_alloc. SYSTEM TEXT": memory ran out outside the transfer.
     *
     * Side effects: those of `httpPost`.
     */
    virtual void RequestTokenEndpoint(std::string &response, const std::string &body);

    /**
     * Verifies the ID token.
     *
     * @throws sso_not_implemented  "VerifyIDToken not implemented"
     */
    virtual void VerifyIDToken();

    /**
     * Returns the body of the token request (RFC 6749, section 4.1.3).
     *
     * @return the form-encoded body
     *
     * @throws sso_not_implemented  "GetIDTokenReqParams not implemented"
     */
    virtual std::string GetIDTokenReqParams();

    /**
     * Reads the user's name from the ID token, without verifying the token.
     *
     * @param userName  receives the name; unchanged in this class
     *
     * @throws sso_not_implemented  "GetUserName not implemented"
     */
    virtual void GetUserName(std::string &userName);

    /**
     * Stores the ID token of a token response.
     *
     * @param response  of the token endpoint; ignored in this class
     *
     * @throws sso_not_implemented  "ProcessTokenResponse not implemented"
     */
    virtual void ProcessTokenResponse(std::string response);

    /**
     * Runs a login: calls `SetCode`, `GetIDTokenReqParams`, `RequestTokenEndpoint`, `ProcessTokenResponse`,
     * `VerifyIDToken` and `GetUserName`, in this order, as virtual functions. Throws what a step throws.
     *
     * @param authorizationCode  as received, percent-decoded
     * @param userName           receives the name; after a failure as for `GetUserName`
     *
     * @throws sso_not_implemented  "GetIDTokenReqParams not implemented", on the base client
     *
     * Log lines: those of the steps. Side effects: those of `httpGet` and `httpPost` (global initialisation and cleanup
     * of libcurl), and of `AzureSSOClient::RequestKeysInfo`.
     */
    virtual void OpenIDConnectLogin(std::string authorizationCode, std::string &userName);

  protected:
    bool enable = false;            ///< returned by `isEnable`
    std::string clientID;           ///< returned by `GetClientID`
    std::string clientSecret;       ///< returned by `GetClientSecret`
    std::string redirectURI;        ///< returned by `GetRedirectURI`
    std::string authEndpoint;       ///< returned by `GetAuthEndpoint`
    std::string tokenEndpoint;      ///< returned by `GetTokenEndpoint`
    std::string logoutEndpoint;     ///< returned by `GetLogoutEndpoint`
    std::string wellknownEndpoint;  ///< returned by `GetWellknownEndpoint`
    std::string code;               ///< stored by `SetCode`
    std::string token;              ///< returned by `GetToken`
};

/**
 * Client of Azure Active Directory. ID tokens are signed with published RSA keys. User names have the NetBIOS form.
 */
class AzureSSOClient : public SSOClient {
  public:
    /**
     * Reads `/usr/tavo/etc/ssoclient/azure.conf` with root's effective ids, and restores the ids. `errno` is 0 or 1
     * afterwards. If the file is missing, unreadable or malformed, or a member is missing or of the wrong type, the
     * settings keep their defaults: empty, and off.
     *
     * Log lines, with "setresuid" or "setresgid":
     *  - `LOG_AUTH | LOG_INFO`: "azuresso:LINE WARNING: setresuid(-1, 0, -1)", for each id set to 0;
     *  - `LOG_AUTH | LOG_ERR`: "azuresso:LINE ERROR: setresuid(-1, ID, -1) [SYSTEM TEXT]", for a failed call. Then
     *    "azuresso:LINE ERROR: ENTERCriticalSection" (not raised) or "azuresso:LINE ERROR: LEAVECriticalSection" (not
     *    restored).
     */
    AzureSSOClient();
    virtual ~AzureSSOClient();

    /**
     * Verifies the ID token: expiry, tenant, audience, then the RSA signature (RFC 7518, section 3.3). For each call,
     * fetches the discovery document and the key set. Allows no clock skew. Does not check "iss", "nbf", "iat" and
     * "nonce".
     *
     * @throws std::invalid_argument  "token cannot be empty"
     * @throws std::invalid_argument  "bad jwt format!", "bad jwt header format!", "bad jwt body format!"
     * @throws std::logic_error  (exactly this class) "empty jwt part": header or body is empty, or memory ran out
     * @throws std::invalid_argument  "id_token expired.": "exp" is past or missing, or the clock cannot be read
     * @throws std::invalid_argument  "tenant ID invalid", "client ID invalid"
     * @throws std::invalid_argument  "kid does not exist in Azure verified kyes", also if a document was not fetched
     * @throws std::invalid_argument  "RSA public 'n' cannot be found!", "RSA public 'e' cannot be found!"
     * @throws TAVO::JWT::jwt_not_support  "ALG algorithm is not supported": "alg" is not RS256, RS384 or RS512
     * @throws TAVO::JWT::jwt_verify_failed  "verify rsa signature failed"
     *
     * Log lines and side effects: those of `RequestWellknownInfo`, `RequestKeysInfo` and
     * `TAVO::JWT::Jwt::JwtRSAVerify`.
     */
    void VerifyIDToken() override;

    /**
     * Returns the body of the token request (RFC 6749, section 4.1.3). It contains secrets.
     *
     * @return client_id, client_secret, code, grant_type and redirect_uri, form-encoded
     */
    std::string GetIDTokenReqParams() override;

    /**
     * Converts a claim of the form `user@domain`, unverified, to the user's name: NetBIOS domain, backslash, user. The
     * claim is "unique_name" or, if that is not a string, "email".
     *
     * @param userName  receives the name; after "cannot get the user name!" the part before the first at sign; after
     *                  "TAVOWinsUserNameFqdn2Netbios failed." the domain in capitals, a backslash and the user.
     *                  Otherwise unchanged on failure
     *
     * @throws std::invalid_argument  "cannot find the user name!": neither claim is a string
     * @throws std::invalid_argument  "cannot get the user name!": the claim does not have exactly one at sign
     * @throws sso_op_failed  "TAVOWinsUserNameFqdn2Netbios failed.": the platform does not know the domain
     * @throws std::invalid_argument  as `GetUserInfo`
     * @throws std::logic_error  as `GetUserInfo`
     */
    void GetUserName(std::string &userName) override;

    /**
     * Stores the ID token of a token response (OpenID Connect Core 1.0, section 3.1.3.3). After a failure, no token is
     * stored.
     *
     * @param response  of the token endpoint
     *
     * @throws std::invalid_argument  "parse json falied": not JSON, or empty
     * @throws sso_err_resp  the whole response as compact JSON and a line feed, if it has a member "error"
     * @throws sso_err_resp  "we cannot find key 'id_token' in response!": missing, or not a string
     */
    void ProcessTokenResponse(std::string response) override;

    /**
     * Returns the claims of the ID token, unverified.
     *
     * @param info  receives the decoded body; unchanged on failure
     *
     * @throws std::invalid_argument  "please request a id_token first.", "bad jwt format!", "bad jwt body format!"
     * @throws std::logic_error  (exactly this class) "empty jwt part": the body is empty, or memory ran out
     */
    void GetUserInfo(Json::Value &info);

    /**
     * Fetches the key set (RFC 7517, section 5). Verifies certificate and host name.
     *
     * @param uri   "jwks_uri" of the discovery document
     * @param keys  receives the document; null if it is not JSON; unchanged if the transfer fails or memory runs out
     *
     * Does not throw. Logs a failure at `LOG_ERR`:
     *  - "azuresso:LINE request wellknown uri TEXT.": libcurl's text, or "bad wellknown json format.";
     *  - "azuresso:LINE no kyes information": there is no "keys";
     *  - "azuresso:LINE curl_easy_init failed. SYSTEM TEXT": memory ran out outside the transfer.
     *
     * Side effects: those of `httpGet`, and one more global cleanup of libcurl. A program that uses libcurl must
     * initialise it again.
     */
    void RequestKeysInfo(std::string uri, Json::Value &keys);

    /**
     * Returns the URL of the authentication request (OpenID Connect Core 1.0, section 3.1.2.1): the authorization
     * endpoint, "?", and these parameters, percent-encoded, in this order:
     *  - client_id;
     *  - nonce: random, new for each call. The caller can store it;
     *  - redirect_uri;
     *  - response_type: "code";
     *  - scope: "openid";
     *  - state: `state` with the nonce's MD5 digest as its member "nonce", as compact JSON and a line feed, in padded
     *    base64. Percent-decode a returned state before you compare it.
     *
     * @param state  a JSON object, or null; up to 721 bytes as compact JSON. A member "nonce" is replaced and does not
     *               count
     * @return the URL
     *
     * @throws sso_op_failed  "encode base64 failed.": the state is too long
     * @throws Json::LogicError  the state is neither an object nor null
     * @throws std::runtime_error  (Boost's) the system's source of random numbers failed
     *
     * Log lines: those of `MD5Digest`. If it fails, the "nonce" in the state is empty.
     */
    std::string GetAccessTokenReqURI(const Json::Value &state);

    /**
     * Writes "Location: ", the URL of `GetAccessTokenReqURI` and two line feeds to `std::cout`, and does not flush it.
     * Writes nothing if `GetAccessTokenReqURI` throws. Write other header lines before this call, and nothing after it.
     *
     * @param state  as for `GetAccessTokenReqURI`
     */
    void RedirectAuthEndpoint(const Json::Value &state);

  protected:
    std::string tenantID;  ///< the required "tid" of the token
};

/**
 * Client of a WebSphere OpenID Connect provider. ID tokens are signed with HMAC and the client secret. User names are
 * those of the token. The discovery document is not used.
 */
class WebSphereSSOClient : public SSOClient {
  public:
    /**
     * Reads `/usr/tavo/etc/ssoclient/websphere.conf` as `AzureSSOClient()` does, with "webspheresso" in the log lines.
     */
    WebSphereSSOClient();
    virtual ~WebSphereSSOClient();

    /**
     * Verifies the ID token: expiry, audience, then the HMAC signature (RFC 7518, section 3.2). Allows no clock skew.
     * Does not check "iss", "nbf", "iat" and "nonce".
     *
     * @throws std::invalid_argument  format and expiry, as `AzureSSOClient::VerifyIDToken`
     * @throws std::logic_error  as `AzureSSOClient::VerifyIDToken`
     * @throws std::invalid_argument  "client ID invalid"
     * @throws TAVO::JWT::jwt_not_support  "ALG algorithm is not supported": "alg" is not HS256, HS384 or HS512
     * @throws sso_op_failed  "encode base64 failed.": the client secret is longer than 765 bytes
     * @throws TAVO::JWT::jwt_verify_failed  "verify hmac signature failed", also if the client secret is empty
     */
    void VerifyIDToken() override;

    /** Returns the body of the token request. @return as `AzureSSOClient::GetIDTokenReqParams` */
    std::string GetIDTokenReqParams() override;

    /**
     * Returns the user's name: the claim "sub", unverified and unchanged.
     *
     * @param userName  receives the name; unchanged on failure
     *
     * @throws std::invalid_argument  "cannot find the user name!": "sub" is missing or not a string
     * @throws std::invalid_argument  as `GetUserInfo`
     * @throws std::logic_error  as `GetUserInfo`
     */
    void GetUserName(std::string &userName) override;

    /**
     * Stores the ID token of a token response. After a failure, no token is stored. Ignores "error".
     *
     * @param response  of the token endpoint
     *
     * @throws std::invalid_argument  "parse json falied": not JSON, or empty
     * @throws sso_err_resp  "we cannot find key 'id_token' in response!": missing, or not a string
     */
    void ProcessTokenResponse(std::string response) override;

    /**
     * As `AzureSSOClient::GetUserInfo`.
     *
     * @param claims  receives the decoded body; unchanged on failure
     */
    void GetUserInfo(Json::Value &claims);

    /**
     * As `AzureSSOClient::GetAccessTokenReqURI`, with the scope "openid profile email".
     *
     * @param stateInfo  a JSON object, or null
     * @return the URL
     */
    std::string GetAccessTokenReqURI(const Json::Value &stateInfo);

    /**
     * As `AzureSSOClient::RedirectAuthEndpoint`.
     *
     * @param stateInfo  as for `GetAccessTokenReqURI`
     */
    void RedirectAuthEndpoint(const Json::Value &stateInfo);
};

/** The configured profile and its client's settings, for programs that do not log in. */
class SSOProfile {
  public:
    /**
     * Reads `/usr/tavo/etc/ssoclient/profile.conf` with root's effective ids and, if single sign-on is on, the client's
     * file. Values that cannot be read stay off and empty, without an exception.
     *
     * Log lines and side effects: those of `AzureSSOClient()`, with "profile" as the source; and "profile:LINE Profile
     * 'NAME' not support" at `LOG_ERR` if single sign-on is on and the profile is unknown.
     */
    SSOProfile();
    virtual ~SSOProfile();

    /** Returns whether single sign-on is on. @return whether "sso_enable" is true */
    bool SSOIsEnable();
    /** Returns the profile's name. @return "sso_profile": "azure", "websphere" or any other text */
    std::string GetSSOProfile();
    /**
     * Returns the settings of the client, as a base client, which cannot log in. Use `SSOIsEnable`, not its `isEnable`.
     *
     * @return a client that this object owns, never null. Its settings are empty if single sign-on is off or the
     *         profile is unknown
     */
    SSOClient *GetSSOClient();

  private:
    bool enable = false;
    std::string profile;
    SSOClient client;
};

/**
 * Completes a login. Reads `/usr/tavo/etc/ssoclient/profile.conf` without raising ids, constructs the client of the
 * profile, and runs its `OpenIDConnectLogin`.
 *
 * @param code      as received, percent-decoded
 * @param userName  receives the name; after a failure as for the client's `GetUserName`
 *
 * @throws sso_op_failed  "read profile file failed.", "sso does not enable.", "not specify sso profile"
 * @throws sso_exception  (exactly this class) "profile not support."
 * @throws std::exception  as `OpenIDConnectLogin`
 *
 * Log lines and side effects: those of the client's constructor and of `OpenIDConnectLogin`.
 */
void OIDCLogin(const std::string &code, std::string &userName);

/**
 * Returns the address of the relay page, which shows the result of a login.
 *
 * @param success  whether the login succeeded
 * @param state    used on success: the state received with the code, which is base64 of a JSON object. Its string
 *                 "origin" is percent-encoded into the address; without one, the origin is omitted
 * @param reason   used on failure. Copied verbatim: percent-encode it. Omitted if empty
 * @return "ssoclient/relay.html#" and "origin=ORIGIN&success=true" or "reason=REASON&success=false"; relative to the
 *         web root of the appliance's pages
 */
std::string GetSSORelayURL(bool success, const std::string &state, const std::string &reason);

/**
 * Returns the URL that ends the Azure session and then opens the relay page (OpenID Connect RP-Initiated Logout 1.0,
 * section 2). WebSphere has none: end your own session only. Log lines and side effects: those of `AzureSSOClient()`.
 *
 * @param base  the URL of the web interface. A trailing "/index.cgi" and then a trailing "/" are removed, and
 *              "/webman/ssoclient/relay.html" is appended
 * @return the logout endpoint with the relay page as "post_logout_redirect_uri"; only the endpoint if `base` is empty
 *
 * @throws std::out_of_range  `base` has 1 to 9 characters
 */
std::string GetAzureSSOLogoutURL(const std::string &base);

/**
 * Fetches a document over HTTP or HTTPS with a new libcurl handle, without a time limit. Does not follow redirects or
 * check the HTTP status.
 *
 * @param url            of the document
 * @param response       passed to the callback as its user pointer
 * @param verifySSL      whether to verify certificate and host name
 * @param writeCallback  receives the response, as libcurl's CURLOPT_WRITEFUNCTION. Must not be null or throw
 *
 * @throws std::bad_alloc  no handle can be created
 * @throws sso_err_resp  libcurl's text: the transfer failed or cannot be prepared, also if memory ran out
 *
 * Side effects: initialises and cleans up libcurl globally. Over TLS, libcurl clears the calling thread's OpenSSL error
 * queue, including marks.
 */
void httpGet(const std::string &url, std::string &response, bool verifySSL,
             std::size_t (*writeCallback)(char *, std::size_t, std::size_t, void *));

/**
 * Posts a form (application/x-www-form-urlencoded). Otherwise as `httpGet`.
 *
 * @param url            that receives the form
 * @param body           sent verbatim, up to its first NUL
 * @param response       as for `httpGet`
 * @param verifySSL      as for `httpGet`
 * @param writeCallback  as for `httpGet`
 *
 * Exceptions and side effects: those of `httpGet`.
 */
void httpPost(const std::string &url, const std::string &body, std::string &response, bool verifySSL,
              std::size_t (*writeCallback)(char *, std::size_t, std::size_t, void *));

/**
 * Percent-encodes a value for a query or a form, with the platform's encoder.
 *
 * @param value  encoded up to its first NUL
 * @return the encoded value; `value` unchanged if the platform rejects it or memory runs out
 */
std::string URLEncode(const std::string &value);

/**
 * Returns the MD5 digest (RFC 1321) of a text.
 *
 * @param data  any bytes, including NUL
 * @return 32 lowercase hexadecimal digits; empty on failure
 *
 * Logs a failure at `LOG_ERR`: "utils:LINE MD5 digest failed SYSTEM TEXT" or "utils:LINE calloc failed. SYSTEM TEXT".
 */
std::string MD5Digest(std::string data);

}  // namespace TAVO::SSO

#pragma GCC visibility pop

#endif
