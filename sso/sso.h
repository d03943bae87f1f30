/**
 * @mainpage Reference
 *
 * Single sign-on of the appliance's web front end through an external OpenID Connect provider: the relying party's
 * side of the authorization-code flow (OpenID Connect Core 1.0, section 3.1; RFC 6749, section 4.1).
 *
 * A login takes two requests of the front end:
 *  1. Start: put a random value into the state and into a cookie of the browser. Construct the client of the profile in
 *     force and send the browser to the address that its `GetAccessTokenReqURI` returns.
 *  2. Return: the browser comes back to the redirect URI with a code and the state. Compare the state's random value
 *     with the cookie. Exchange the code with the client's `OpenIDConnectLogin`, which yields the user's name.
 *     Compare the "nonce" of the ID token (`GetUserInfo`) with the nonce of the start. Then open a session.
 *
 * `GetSSORelayURL` returns the address of the relay page, which shows the user the outcome.
 *
 * @warning The library keeps nothing between requests. The caller must bind each return to the browser that started the
 * login, and the token's nonce to that start. Without the first, anyone can sign a victim's browser in to an account of
 * their own. Without the second, anyone who has a stolen code can sign in with it. `OIDCLogin` checks neither.
 *
 * Every failure is an exception; every text that `what()` gives is fixed and part of this interface, misspellings
 * included. Diagnostics go to `syslog`, each line beginning "SOURCE:LINE ". Any function may also throw
 * `std::bad_alloc` when memory runs out.
 *
 * One thread at a time: constructing a client or a profile changes the effective ids of the whole process while a file
 * is read, and every HTTP request initialises and cleans up libcurl globally. A request over TLS also clears the
 * calling thread's OpenSSL error queue, marks included, because libcurl does.
 *
 * The layout of the classes and the order of their virtual functions are fixed under soname `libtavosso.so.6`:
 * programs are linked against them, and a change would break them silently.
 */

/**
 * @file
 * The login and the addresses around it: the clients of the two providers, the profile, the exceptions.
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
 * Root of the failures of single sign-on. Only `OIDCLogin` throws exactly this class, for a profile that is not
 * supported: a caller that catches `sso_op_failed` alone does not see that one.
 */
class sso_exception : public std::runtime_error {
  public:
    /** @param message  the text that `what()` gives */
    explicit sso_exception(std::string message);
    ~sso_exception() override;
};

/**
 * A transfer failed (`what()` is then libcurl's text for it), or the provider's answer cannot be used. Where the Azure
 * provider answered with an error, `what()` holds the whole answer: do not show it to a user or write it to a log.
 */
class sso_err_resp : public sso_exception {
  public:
    /** @param message  the text that `what()` gives */
    explicit sso_err_resp(std::string message);
    ~sso_err_resp() override;
};

/** A step of the login was called on the plain base client, which does not know any provider. */
class sso_not_implemented : public sso_exception {
  public:
    /** @param message  the text that `what()` gives */
    explicit sso_not_implemented(std::string message);
    ~sso_not_implemented() override;
};

/** Something on this machine is missing or failed: the profile, the platform's encoder, its domain conversion. */
class sso_op_failed : public sso_exception {
  public:
    /** @param message  the text that `what()` gives */
    explicit sso_op_failed(std::string message);
    ~sso_op_failed() override;
};

/**
 * What every provider's client has in common: its settings, the two exchanges with the provider, and the fixed order
 * of a login. It serves one login.
 *
 * It has no virtual destructor. To delete a client through this type is undefined behaviour:
 * @code
 * std::unique_ptr<TAVO::SSO::SSOClient> client = std::make_unique<TAVO::SSO::AzureSSOClient>();  // forbidden
 * TAVO::SSO::AzureSSOClient client;                                                             // use this
 * @endcode
 */
class SSOClient {
  public:
    /**
     * Tells whether the client's own file switches it on. Logins go by the profile instead.
     * @return "azure_sso_enable"; always false for WebSphere, whose file has no such key
     */
    virtual bool isEnable();
    /** Gives the client identifier. @return as registered at the provider (RFC 6749, section 2.2) */
    virtual std::string GetClientID();
    /** Gives the client secret. @return as registered at the provider: never show it or log it */
    virtual std::string GetClientSecret();
    /** Gives the redirect URI. @return as registered at the provider, or as `SetRedirectURI` set it */
    virtual std::string GetRedirectURI();
    /** Gives the ID token. @return the compact token; empty before `ProcessTokenResponse`, and after it failed */
    virtual std::string GetToken();
    /** Gives the authorization endpoint. @return as configured */
    virtual std::string GetAuthEndpoint();
    /** Gives the token endpoint. @return as configured */
    virtual std::string GetTokenEndpoint();
    /** Gives the address of the discovery document. @return as configured */
    virtual std::string GetWellknownEndpoint();
    /** Gives the logout endpoint. @return as configured */
    virtual std::string GetLogoutEndpoint();
    /** Sets another redirect URI. @param uri  takes the place of the configured one; not checked */
    virtual void SetRedirectURI(std::string uri);
    /** Sets the code. @param authorizationCode  that of this login, percent-decoded; not checked, never returned */
    virtual void SetCode(std::string authorizationCode);

    /**
     * Fetches the discovery document (OpenID Connect Discovery 1.0, section 4), with the provider's certificate and
     * host name verified.
     *
     * @param out  receives the document; null when the answer is not JSON, untouched when the transfer failed or memory
     *             ran out
     *
     * Does not throw for a failed transfer or a malformed answer. Each is one line at `LOG_ERR`:
     *  - "sso:LINE TEXT" with libcurl's text or "bad wellknown json format.";
     *  - "sso:LINE bad_alloc. SYSTEM TEXT" when no transfer handle can be made.
     *
     * Memory that runs out during the transfer fails it with libcurl's text; otherwise it is the second line.
     *
     * Side effects: those of `httpGet`.
     */
    virtual void RequestWellknownInfo(Json::Value &out);

    /**
     * Posts the token request to the token endpoint (RFC 6749, section 4.1.3), with the provider's certificate and
     * host name verified.
     *
     * @param response  the answer is appended to it, whatever its HTTP status; on a failure it holds what had arrived.
     *                  Of a chunk that holds a NUL byte, only the part before it is taken
     * @param body      the form-encoded body, as `GetIDTokenReqParams` gives it
     *
     * Does not throw for a failed transfer; the next step reports it. It is one line at `LOG_ERR`:
     *  - "sso:LINE request token uri TEXT." with libcurl's text;
     *  - "sso:LINE bad_alloc. SYSTEM TEXT" when no transfer handle can be made.
     *
     * Memory that runs out during the transfer fails it with libcurl's text; otherwise it is the second line.
     *
     * Side effects: those of `httpPost`.
     */
    virtual void RequestTokenEndpoint(std::string &response, const std::string &body);

    /**
     * Decides whether the ID token may be trusted; returns if so.
     *
     * @throws sso_not_implemented  "VerifyIDToken not implemented", always, in this class
     */
    virtual void VerifyIDToken();

    /**
     * Builds the body of the token request (RFC 6749, section 4.1.3).
     *
     * @return nothing in this class; a provider's client gives the form-encoded body
     *
     * @throws sso_not_implemented  "GetIDTokenReqParams not implemented", always, in this class
     */
    virtual std::string GetIDTokenReqParams();

    /**
     * Gives the appliance's name of the user whom the ID token names. Verifies nothing: call `VerifyIDToken` first.
     *
     * @param userName  untouched in this class; a provider's client writes the name to it
     *
     * @throws sso_not_implemented  "GetUserName not implemented", always, in this class
     */
    virtual void GetUserName(std::string &userName);

    /**
     * Takes the ID token out of the token endpoint's answer.
     *
     * @param response  the answer; not looked at in this class
     *
     * @throws sso_not_implemented  "ProcessTokenResponse not implemented", always, in this class
     */
    virtual void ProcessTokenResponse(std::string response);

    /**
     * Runs a login: `SetCode`, `GetIDTokenReqParams`, `RequestTokenEndpoint`, `ProcessTokenResponse`, `VerifyIDToken`,
     * `GetUserName`, in this order, each as a virtual call.
     *
     * @param authorizationCode  the code that the browser brought back, percent-decoded
     * @param userName           receives the user's name; see the client's `GetUserName` for what it holds after a
     *                           failure
     *
     * What a step throws passes through, and the steps after it are skipped. On a plain base client that is
     * sso_not_implemented "GetIDTokenReqParams not implemented", after the code has been stored.
     */
    virtual void OpenIDConnectLogin(std::string authorizationCode, std::string &userName);

  protected:
    bool enable = false;            ///< what `isEnable` gives
    std::string clientID;           ///< what `GetClientID` gives
    std::string clientSecret;       ///< what `GetClientSecret` gives
    std::string redirectURI;        ///< what `GetRedirectURI` gives
    std::string authEndpoint;       ///< what `GetAuthEndpoint` gives
    std::string tokenEndpoint;      ///< what `GetTokenEndpoint` gives
    std::string logoutEndpoint;     ///< what `GetLogoutEndpoint` gives
    std::string wellknownEndpoint;  ///< what `GetWellknownEndpoint` gives
    std::string code;               ///< the authorization code that `SetCode` stored
    std::string token;              ///< what `GetToken` gives
};

/**
 * The client of Azure Active Directory: ID tokens signed with RSA keys that the provider publishes, user names in the
 * appliance's NetBIOS form.
 */
class AzureSSOClient : public SSOClient {
  public:
    /**
     * Reads `/usr/tavo/etc/ssoclient/azure.conf` with root's effective ids. A missing, unreadable or malformed file, a
     * missing member and a member of another type than told leave the settings at their defaults: empty, and off.
     *
     * The process's effective ids are raised for the read and put back; `errno` is left at 0 or 1. Log lines, under
     * `LOG_AUTH`, when ids had to change or could not be:
     *  - `LOG_INFO`: "azuresso:LINE WARNING: setresuid(-1, 0, -1)" (or "setresgid") for each id set to 0;
     *  - `LOG_ERR`: "azuresso:LINE ERROR: setresuid(-1, ID, -1) [SYSTEM TEXT]" (or "setresgid") for a call that failed,
     *    then "azuresso:LINE ERROR: ENTERCriticalSection" or "azuresso:LINE ERROR: LEAVECriticalSection".
     */
    AzureSSOClient();
    virtual ~AzureSSOClient();

    /**
     * Checks the ID token, in this order: lifetime, tenant, audience; then fetches the discovery document and the key
     * set, afresh, and checks the RSA signature (RFC 7515, section 5.2; RFC 7518, section 3.3). No leeway for clocks;
     * issuer, not-before, issued-at and nonce are not looked at.
     *
     * @throws std::invalid_argument  "token cannot be empty"; "bad jwt format!", "bad jwt header format!", "bad jwt
     * body format!"; "id_token expired." ("exp" lies before now or is missing, or the clock cannot be read); "tenant ID
     * invalid"; "client ID invalid"; "kid does not exist in Azure verified kyes" (also when a document could not be
     * fetched); "RSA public 'n' cannot be found!", "RSA public 'e' cannot be found!"
     * @throws std::logic_error  (exactly this class) "empty jwt part": header or body of the token is empty, or memory
     * runs out over it
     * @throws TAVO::JWT::jwt_not_support  "ALG algorithm is not supported": "alg" is not RS256, RS384 or RS512
     * @throws TAVO::JWT::jwt_verify_failed  "verify rsa signature failed"
     *
     * Log lines and side effects: those of `RequestWellknownInfo`, `RequestKeysInfo` and
     * `TAVO::JWT::Jwt::JwtRSAVerify`.
     */
    void VerifyIDToken() override;

    /**
     * Builds the body of the token request (RFC 6749, section 4.1.3).
     *
     * @return client_id, client_secret, code, grant_type and redirect_uri, form-encoded.
     *         It holds the client secret and the code
     */
    std::string GetIDTokenReqParams() override;

    /**
     * Gives the user's name as the appliance knows it: NetBIOS domain, backslash, user. It is made of the claim
     * "unique_name" or, where that is not a string, "email", which must have the form `user@domain`.
     *
     * @param userName  receives the name, step by step: after "cannot get the user name!" it holds the part before the
     *                  first at sign, after "TAVOWinsUserNameFqdn2Netbios failed." the upper-cased domain, a backslash
     *                  and the user; after every other failure it is untouched
     *
     * @throws std::invalid_argument  "please request a id_token first."; as the token's format demands
     *         (`VerifyIDToken`); "cannot find the user name!" (neither claim is a string); "cannot get the user name!"
     *         (not exactly one at sign)
     * @throws std::logic_error  (exactly this class) "empty jwt part": the body of the token is empty, or memory runs
     * out over it
     * @throws sso_op_failed  "TAVOWinsUserNameFqdn2Netbios failed.": the platform does not know the domain
     */
    void GetUserName(std::string &userName) override;

    /**
     * Stores the ID token of a token response (OpenID Connect Core 1.0, section 3.1.3.3). The token of an earlier
     * response is forgotten first, so that every failure leaves none.
     *
     * @param response  the answer of the token endpoint
     *
     * @throws std::invalid_argument  "parse json falied": not JSON, the empty answer included
     * @throws sso_err_resp  the whole answer as compact JSON with a line feed at its end, where it has a member
     *         "error"; "we cannot find key 'id_token' in response!" where "id_token" is missing or not a string
     */
    void ProcessTokenResponse(std::string response) override;

    /**
     * Returns the claims of the ID token. It verifies nothing: call `VerifyIDToken` first.
     *
     * @param info  receives the decoded body; untouched on failure
     *
     * @throws std::invalid_argument  "please request a id_token first."; as the token's format demands
     * @throws std::logic_error  (exactly this class) "empty jwt part": the body of the token is empty, or memory runs
     * out over it
     */
    void GetUserInfo(Json::Value &info);

    /**
     * Fetches the provider's key set (RFC 7517, section 5), certificate and host name verified.
     *
     * @param uri   where it is published ("jwks_uri" of the discovery document)
     * @param keys  receives the document; null when the answer is not JSON, untouched when the transfer failed or
     *              memory ran out
     *
     * Does not throw for those failures, nor for a document without "keys". Each is one line at `LOG_ERR`:
     *  - "azuresso:LINE request wellknown uri TEXT." with libcurl's text or "bad wellknown json format.";
     *  - "azuresso:LINE no kyes information";
     *  - "azuresso:LINE curl_easy_init failed. SYSTEM TEXT" when no transfer handle can be made.
     *
     * Memory that runs out during the transfer fails it with libcurl's text; otherwise it is the third line.
     *
     * Side effects: those of `httpGet`. Calls `curl_global_cleanup` once more than it initialises: a host that uses
     * libcurl itself initialises it again.
     */
    void RequestKeysInfo(std::string uri, Json::Value &keys);

    /**
     * Builds the authentication request (OpenID Connect Core 1.0, section 3.1.2.1). The parameters are, in this order:
     *  - client_id;
     *  - nonce: fresh and random. The caller can take it from the address and keep it on the server;
     *  - redirect_uri;
     *  - response_type: "code";
     *  - scope: "openid";
     *  - state: `state` with the member "nonce" added, the MD5 digest of the nonce. Compact JSON and a line feed in
     *    padded base64. Percent-decode the state that comes back before you compare it.
     *
     * @param state  the caller's JSON object, or null; its member "nonce" is replaced. As compact JSON, without a
     *               "nonce", it may be 721 bytes long
     * @return the authorization endpoint, as configured, "?", and the parameters, percent-encoded
     *
     * @throws sso_op_failed  "encode base64 failed.": the state does not fit
     * @throws Json::LogicError  when `state` is neither an object nor null
     * @throws std::runtime_error  of Boost's, when the system's source of random numbers fails
     *
     * Log lines: those of `MD5Digest`, whose failure leaves the state with an empty "nonce".
     */
    std::string GetAccessTokenReqURI(const Json::Value &state);

    /**
     * Writes the CGI redirect to that address on `std::cout`: "Location: ", the address, two line feeds; the stream is
     * not flushed. The caller may have written other header lines before, and writes nothing after.
     *
     * @param state  as for `GetAccessTokenReqURI`, whose exceptions pass through; nothing is written then
     */
    void RedirectAuthEndpoint(const Json::Value &state);

  protected:
    std::string tenantID;  ///< the tenant that the token's "tid" must equal
};

/**
 * The client of a WebSphere OpenID Connect provider: ID tokens signed with HMAC under the client secret, user names as
 * they stand in the token. It takes every endpoint from its file and never fetches the discovery document.
 */
class WebSphereSSOClient : public SSOClient {
  public:
    /**
     * Reads `/usr/tavo/etc/ssoclient/websphere.conf`; otherwise as `AzureSSOClient()`, with "webspheresso" as the
     * source in the log lines.
     */
    WebSphereSSOClient();
    virtual ~WebSphereSSOClient();

    /**
     * Checks the ID token, in this order: lifetime, audience, and its HMAC signature under the client secret (RFC 7515,
     * section 5.2; RFC 7518, section 3.2). No leeway for clocks; issuer, not-before, issued-at and nonce are not looked
     * at.
     *
     * @throws std::invalid_argument  "token cannot be empty"; "bad jwt format!", "bad jwt header format!", "bad jwt
     * body format!"; "id_token expired." ("exp" lies before now or is missing, or the clock cannot be read); "client ID
     * invalid"
     * @throws std::logic_error  (exactly this class) "empty jwt part": header or body of the token is empty, or memory
     * runs out over it
     * @throws TAVO::JWT::jwt_not_support  "ALG algorithm is not supported": "alg" is not HS256, HS384 or HS512
     * @throws sso_op_failed  "encode base64 failed.": the client secret is longer than 765 bytes
     * @throws TAVO::JWT::jwt_verify_failed  "verify hmac signature failed", also under an empty client secret
     */
    void VerifyIDToken() override;

    /** Builds the body of the token request. @return as `AzureSSOClient::GetIDTokenReqParams` gives it */
    std::string GetIDTokenReqParams() override;

    /**
     * Gives the user's name: the claim "sub", unchanged.
     *
     * @param userName  receives the name; untouched on failure
     *
     * @throws std::invalid_argument  "please request a id_token first."; as the token's format demands
     *         (`VerifyIDToken`); "cannot find the user name!": "sub" is missing or not a string
     * @throws std::logic_error  (exactly this class) "empty jwt part": the body of the token is empty, or memory runs
     * out over it
     */
    void GetUserName(std::string &userName) override;

    /**
     * Stores the ID token of a token response. The token of an earlier response is forgotten first, so that every
     * failure leaves none. An error answer of the provider has no reaction of its own.
     *
     * @param response  the answer of the token endpoint
     *
     * @throws std::invalid_argument  "parse json falied": not JSON, the empty answer included
     * @throws sso_err_resp  "we cannot find key 'id_token' in response!": missing, or not a string
     */
    void ProcessTokenResponse(std::string response) override;

    /**
     * Returns the claims of the ID token. It verifies nothing: call `VerifyIDToken` first.
     *
     * @param claims  receives the decoded body; untouched on failure
     *
     * @throws std::invalid_argument  "please request a id_token first."; as the token's format demands
     * @throws std::logic_error  (exactly this class) "empty jwt part": the body of the token is empty, or memory runs
     * out over it
     */
    void GetUserInfo(Json::Value &claims);

    /**
     * As `AzureSSOClient::GetAccessTokenReqURI`, with the scope "openid profile email".
     *
     * @param stateInfo  the caller's JSON object, or null
     * @return the authorization endpoint, as configured, and the query
     */
    std::string GetAccessTokenReqURI(const Json::Value &stateInfo);

    /**
     * As `AzureSSOClient::RedirectAuthEndpoint`.
     *
     * @param stateInfo  as for `GetAccessTokenReqURI`
     */
    void RedirectAuthEndpoint(const Json::Value &stateInfo);
};

/** The profile in force and the settings of its client, for callers that do not log in. */
class SSOProfile {
  public:
    /**
     * Reads `/usr/tavo/etc/ssoclient/profile.conf` with root's effective ids and, where single sign-on is on, the
     * chosen client's own file. Does not throw for a missing, unreadable or malformed file, nor for an unknown profile:
     * what could not be read stays off and empty.
     *
     * Side effects and log lines on the process's ids as for `AzureSSOClient()`, with "profile" as the source; and
     * "profile:LINE Profile 'NAME' not support" at `LOG_ERR` where single sign-on is on and the profile is unknown.
     */
    SSOProfile();
    virtual ~SSOProfile();

    /** Tells whether single sign-on is on. @return whether "sso_enable" is true */
    bool SSOIsEnable();
    /** Gives the profile's name. @return "sso_profile": "azure", "websphere", or whatever else stands in the file */
    std::string GetSSOProfile();
    /**
     * Gives the settings of the chosen client. It cannot log in: its provider steps throw `sso_not_implemented`.
     * Whether single sign-on is on is `SSOIsEnable`, never this client's `isEnable`.
     *
     * @return never null; empty where single sign-on is off or the profile is unknown. It belongs to this object: do
     *         not delete it, and do not use it when this object is gone
     */
    SSOClient *GetSSOClient();

  private:
    bool enable = false;
    std::string profile;
    SSOClient client;
};

/**
 * Completes a login: reads `/usr/tavo/etc/ssoclient/profile.conf` (with the ids that the process has), constructs the
 * client that it names, and runs that client's `OpenIDConnectLogin`.
 *
 * @param code      the authorization code that the browser brought back, percent-decoded
 * @param userName  receives the user's name; see the client's `GetUserName` for what it holds after a failure
 *
 * @throws sso_op_failed  "read profile file failed."; "sso does not enable."; "not specify sso profile"
 * @throws sso_exception  (exactly this class) "profile not support."
 * What the client's construction and its `OpenIDConnectLogin` throw passes through.
 *
 * Log lines and side effects: those of the client's construction, which raises the process's ids for a moment, and of
 * its login.
 */
void OIDCLogin(const std::string &code, std::string &userName);

/**
 * Tells the caller where to send the browser after a login.
 *
 * @param success  whether the login succeeded
 * @param state    the state that came back with the code: base64 of a JSON object whose string "origin" is handed on,
 *                 percent-encoded. Anything else leaves the origin out. Not looked at after a failure
 * @param reason   a failure text, put in as it stands: percent-encode what is not your own. Left out when empty
 * @return the address of the relay page, relative to the caller's web root for such pages: "ssoclient/relay.html#",
 * then "origin=ORIGIN&" and "success=true", or "reason=REASON&" and "success=false"
 */
std::string GetSSORelayURL(bool success, const std::string &state, const std::string &reason);

/**
 * Returns the address that ends the Azure session and brings the browser back to the relay page (OpenID Connect
 * RP-Initiated Logout 1.0, section 2). WebSphere has no such page: end your own session only. Reads
 * `/usr/tavo/etc/ssoclient/azure.conf` as `AzureSSOClient()` does.
 *
 * @param base  the address of the web interface. One final "/index.cgi", then one final "/", is removed, and
 *              "/webman/ssoclient/relay.html" is always appended
 * @return the logout endpoint, as configured, with the relay page as "post_logout_redirect_uri"; the bare endpoint when
 *         `base` is empty
 *
 * @throws std::out_of_range  when `base` has 1 to 9 characters
 */
std::string GetAzureSSOLogoutURL(const std::string &base);

/**
 * Fetches a document over HTTP or HTTPS with a fresh libcurl handle. No time limit, no redirects followed; the HTTP
 * status is not checked.
 *
 * Side effects: initialises and cleans up libcurl globally. Over TLS, libcurl clears the calling thread's OpenSSL error
 * queue, marks included.
 *
 * @param url            where
 * @param response       handed to the callback as its user pointer, otherwise untouched
 * @param verifySSL      whether to verify the server's certificate and host name
 * @param writeCallback  receives the answer, in the form of libcurl's CURLOPT_WRITEFUNCTION; must not throw, nor be
 * null
 *
 * @throws std::bad_alloc  when no handle can be made
 * @throws sso_err_resp  with libcurl's text, when the transfer fails or cannot be prepared, also for want of memory
 */
void httpGet(const std::string &url, std::string &response, bool verifySSL,
             std::size_t (*writeCallback)(char *, std::size_t, std::size_t, void *));

/**
 * Posts a form (application/x-www-form-urlencoded); otherwise as `httpGet`, whose exceptions and side effects it has.
 *
 * @param url            where
 * @param body           sent as it stands, up to its first NUL
 * @param response       handed to the callback as its user pointer, otherwise untouched
 * @param verifySSL      whether to verify the server's certificate and host name
 * @param writeCallback  receives the answer, as for `httpGet`
 */
void httpPost(const std::string &url, const std::string &body, std::string &response, bool verifySSL,
              std::size_t (*writeCallback)(char *, std::size_t, std::size_t, void *));

/**
 * Percent-encodes a value for a query or a form with the platform's encoder.
 *
 * @param value  encoded up to its first NUL
 * @return the encoded value; `value` unchanged when the platform refuses it or memory runs out
 */
std::string URLEncode(const std::string &value);

/**
 * Digests a text, as the state carries that of the nonce.
 *
 * @param data  any bytes, NUL included
 * @return the MD5 digest (RFC 1321) as 32 lowercase hexadecimal digits. Empty on failure, with one line at `LOG_ERR`:
 *         "utils:LINE MD5 digest failed SYSTEM TEXT" or "utils:LINE calloc failed. SYSTEM TEXT"
 */
std::string MD5Digest(std::string data);

}  // namespace TAVO::SSO

#pragma GCC visibility pop

#endif
