/**
 * @file
 * Secure sign-in for a web front end: the checks that a program must add to the library's login. Link `tavosso::web`
 * with CMake, or `tavosso-web` with pkg-config.
 */
#ifndef TAVOSSO_WEB_WEB_H
#define TAVOSSO_WEB_WEB_H

#include <json/json.h>

#include <cstddef>
#include <optional>
#include <string>
#include <utility>
#include <vector>

/**
 * The relying party's checks that belong to the front end (OpenID Connect Core 1.0, section 3.1). `StartLogin` and
 * `FinishLogin` take and return plain values: they fit CGI, FastCGI and any web framework. They keep state only in the
 * `LoginStore`. One thread at a time, as for `sso.h`.
 */
namespace TAVO::Web {

/** A request of the browser. */
struct Request {
    std::string method;   ///< such as "GET"
    std::string query;    ///< without its "?", percent-encoded as received
    std::string cookies;  ///< the Cookie header; join several with "; "; empty if there is none
};

/**
 * The response to the browser. Every response starts with the headers that keep it out of caches, frames and referrers.
 */
class Response {
  public:
    std::string status = "200 OK";                             ///< status code and reason phrase
    std::vector<std::pair<std::string, std::string>> headers;  ///< names and values, in order
    std::string body;                                          ///< empty for a redirect

    Response();

    /**
     * Adds a header.
     * @param name   a token (RFC 9110, section 5.6.2)
     * @param value  one printable line of UTF-8
     * @throws std::invalid_argument  for another name or value; nothing is added then
     */
    void AddHeader(const std::string &name, const std::string &value);

    /**
     * Sets a cookie for this host, over TLS, hidden from scripts: Path=/, Secure, HttpOnly, SameSite=Lax.
     * @param name   a token with the prefix "__Host-"
     * @param value  without blanks, quotation marks, commas, semicolons and backslashes
     * @param more   further attributes, such as "; Max-Age=600". Without a Max-Age the cookie ends with the browser
     * @throws std::invalid_argument  for another name or value; nothing is added then
     */
    void SetCookie(const std::string &name, const std::string &value, const std::string &more = "");

    /** Expires a cookie. @param name  of the cookie. @throws std::invalid_argument  as `AddHeader` */
    void ExpireCookie(const std::string &name);

    /**
     * Redirects the browser, with status 302. Replaces an earlier redirect.
     * @param address  an absolute URL, or a path of this site
     * @throws std::invalid_argument  as `AddHeader`; the response is unchanged then
     */
    void Redirect(const std::string &address);
};

/**
 * Stores logins between start and return. Several requests may use the same store at once. If a store throws,
 * `StartLogin` and `FinishLogin` return `Failure::kStorage` with the exception's text as the `reason`.
 */
class LoginStore {
  public:
    virtual ~LoginStore();

    /**
     * Stores a login for `kLoginSeconds`.
     * @param name  32 lowercase hexadecimal digits, never used before
     * @param text  the login, up to 4 KB
     * @return false, and stores nothing, if no more logins fit
     */
    [[nodiscard]] virtual bool Keep(const std::string &name, const std::string &text) = 0;

    /**
     * Returns a login and removes it. If two requests take the same login, only one gets it.
     * @param name  as given to `Keep`
     * @return the text; nothing if it is unknown, taken or older than `kLoginSeconds`
     */
    virtual std::optional<std::string> Take(const std::string &name) = 0;
};

constexpr int kLoginSeconds = 600;          ///< how long a user may take to sign in
constexpr std::size_t kMostLogins = 1'000;  ///< default capacity of a `FolderLoginStore`

/** Stores each login in a file that only the program's user can read. */
class FolderLoginStore : public LoginStore {
  public:
    /**
     * @param folder  an absolute path without symbolic links. Its parent must exist, and only root or the program's
     * user may be able to change the path. The first use creates the folder with mode 0700. Use the folder for nothing
     * else
     * @param most    maximum number of logins at a time
     */
    explicit FolderLoginStore(std::string folder, std::size_t most = kMostLogins);

    /**
     * As `LoginStore::Keep`. Removes logins that are too old, at most once a minute unless the folder is full.
     * @param name  as for `LoginStore::Keep`
     * @param text  as for `LoginStore::Keep`
     * @return as `LoginStore::Keep`
     * @throws std::system_error      if the system refuses, or another user can read the folder or change its path
     * @throws std::invalid_argument  for another name, or a relative path of the folder
     */
    [[nodiscard]] bool Keep(const std::string &name, const std::string &text) override;

    /**
     * As `LoginStore::Take`.
     * @param name  as for `LoginStore::Take`
     * @return as `LoginStore::Take`
     * @throws std::system_error      as `Keep`
     * @throws std::invalid_argument  for a relative path of the folder
     */
    std::optional<std::string> Take(const std::string &name) override;

  private:
    std::string folder_;
    std::size_t most_;
};

/** Why a login failed. The names that `NameOf` returns are stable; a later version may add some. */
enum class Failure {
    kSwitchedOff,       ///< "switched_off": single sign-on is off, or profile.conf is missing or not JSON
    kNotSetUp,          ///< "not_set_up": the profile is unknown, or a setting of its client is empty
    kNotPermitted,      ///< "not_permitted": the program may not read a configuration file
    kTooManyLogins,     ///< "too_many_logins": the store is full
    kStorage,           ///< "storage": the store failed
    kInvalidRequest,    ///< "invalid_request": method, state or code are not those of a return
    kOtherBrowser,      ///< "other_browser": this browser did not start the login
    kLoginExpired,      ///< "login_expired": the login took too long, or was already completed
    kStateChanged,      ///< "state_changed": the state is not the one that was sent
    kProfileChanged,    ///< "profile_changed": profile, client id or token endpoint differ from the start's
    kProviderRefused,   ///< "provider_refused": the provider reported an error; see `FailedLogin::providerError`
    kNetwork,           ///< "network": a request to the provider failed
    kCertificate,       ///< "certificate": the provider's certificate was refused
    kInvalidResponse,   ///< "invalid_response": a response of the provider cannot be used
    kInvalidToken,      ///< "invalid_token": the ID token is malformed, or has another audience or algorithm
    kTokenExpired,      ///< "token_expired": the ID token has expired, or this machine's clock is wrong
    kOtherTenant,       ///< "other_tenant": the account belongs to another organisation
    kUnknownKey,        ///< "unknown_key": the provider does not publish the key that signed the token
    kInvalidSignature,  ///< "invalid_signature": the signature of the ID token is wrong
    kOtherLogin,        ///< "other_login": the ID token was issued for another login
    kUserName,          ///< "user_name": the ID token has no usable name
    kUnverifiedEmail,   ///< "unverified_email": the provider has not verified the e-mail address that names the user
    kUnknownDomain,     ///< "unknown_domain": the appliance does not know the user's domain
    kInternal,          ///< "internal": anything else, such as exhausted memory
};

/** Returns the stable name of a failure. @param failure  any. @return as documented at its enumerator */
std::string NameOf(Failure failure);

/** A login that failed. */
struct FailedLogin {
    Failure failure = Failure::kInternal;  ///< the code
    std::string reason;         ///< one printable line for the log, without secrets; the library's texts are fixed
    std::string providerError;  ///< the provider's "error" (RFC 6749); empty for other failures, and if the library
                                ///< does not report it
    std::string sentence;       ///< one sentence for the user, in English
    std::string hint;           ///< what an administrator can do
};

/**
 * Describes an exception of the library, for programs that call it themselves.
 * @param error  any exception
 * @return the failure; its texts contain no secret
 */
FailedLogin FailedLoginOf(const std::exception &error);

/** The result of `StartLogin`. */
struct StartedLogin {
    Response response;                   ///< redirects the browser to the provider; has only headers after a failure
    std::optional<FailedLogin> failure;  ///< nothing if the login was started
    std::string origin;                  ///< the page to return to
};

/**
 * Returns whether the provider sent the browser, for a program that handles both the start and the return.
 * @param request  of the browser
 * @return whether the query has "state" or "error" (RFC 6749, section 4.1.2)
 */
bool IsReturn(const Request &request);

/**
 * Starts a login: chooses the client of the configured profile, stores the login, binds it to the browser by a cookie,
 * and redirects the browser to the provider. Up to 16 tabs of a browser can sign in at once.
 *
 * @param request    of the browser, with method GET. Its parameter "origin" is the page to return to: a path of this
 *                   site, else `startPage`
 * @param store      stores the login
 * @param startPage  a path of this site
 * @return the response, and the failure if there is one. Failures are returned, not thrown
 *
 * Log lines and side effects: those of the clients' construction and of `GetAccessTokenReqURI` in `sso.h`.
 */
StartedLogin StartLogin(const Request &request, LoginStore &store, const std::string &startPage = "/index.cgi");

/** The user of a login that was finished. */
struct User {
    std::string name;         ///< the appliance's name for the user; printable, never empty
    std::string displayName;  ///< the claim "name" on one printable line; may be empty
    std::string profile;      ///< "azure" or "websphere"
    Json::Value claims;       ///< all claims of the verified ID token
};

/** The result of `FinishLogin`. */
struct FinishedLogin {
    Response response;                   ///< expires the login's cookie; the caller adds the session and a redirect
    std::optional<User> user;            ///< the user, if the login succeeded
    std::optional<FailedLogin> failure;  ///< else the failure
    std::string origin;                  ///< the page to return to; empty if the state is not the one that was sent
    std::string state;                   ///< as received, percent-decoded: for `GetSSORelayURL`
};

/** Options of `FinishLogin`. */
struct FinishOptions {
    /** Whether an unverified "email" may name an Azure user. Users can often choose that address. */
    bool acceptUnverifiedEmail = false;
};

/**
 * Finishes a login at the redirect URI. It accepts the return only if this browser started the login within
 * `kLoginSeconds`, has not finished it before and returns the state unchanged, and if the settings are the same. Then
 * it exchanges the code, verifies the ID token, and rejects a token of another login (nonce) and a name that cannot be
 * trusted. Open the session for `user` afterwards, under a new random name.
 *
 * @param request  of the browser, with method GET
 * @param store    as given to `StartLogin`
 * @param options  what else to accept
 * @return the user or the failure; failures are returned, not thrown
 *
 * Log lines: those of the library's steps; and, at `LOG_AUTH | LOG_ERR`, "frontend: jwks_uri of the discovery document
 * is not an https:// URL": key sets are fetched over HTTPS only.
 *
 * Side effects: those of `httpGet` and `httpPost` in `sso.h`. If the provider's response or key is missing, one or two
 * more requests, without secrets and of at most five seconds each, find out why.
 */
FinishedLogin FinishLogin(const Request &request, LoginStore &store, const FinishOptions &options = {});

/** Escapes a text for element content and quoted attribute values of HTML. @param text  any. @return the HTML */
std::string EscapeHtml(const std::string &text);

}  // namespace TAVO::Web

#endif
