#ifndef TAVOSSO_SSO_NAMES_H
#define TAVOSSO_SSO_NAMES_H

// Names of the profile file and of the protocol.
namespace TAVO::SSO {

constexpr char kProfileFile[] = "/usr/tavo/etc/ssoclient/profile.conf";
constexpr char kProfileEnable[] = "sso_enable";
constexpr char kProfileName[] = "sso_profile";

// Request parameters: RFC 6749, appendix A; OpenID Connect Core 1.0, section 3.1.2.1.
constexpr char kClientID[] = "client_id";
constexpr char kClientSecret[] = "client_secret";
constexpr char kCode[] = "code";
constexpr char kGrantType[] = "grant_type";
constexpr char kNonce[] = "nonce";
constexpr char kRedirectURI[] = "redirect_uri";
constexpr char kResponseType[] = "response_type";
constexpr char kScope[] = "scope";
constexpr char kState[] = "state";

constexpr char kAuthorizationCode[] = "authorization_code";

/// Member of the caller's state: the page to return to.
constexpr char kOrigin[] = "origin";

// Token response: RFC 6749, section 5.1, and what Azure adds. Only "id_token" is read.
constexpr char kTokenType[] = "token_type";
constexpr char kExpiresIn[] = "expires_in";
constexpr char kExtExpiresIn[] = "ext_expires_in";
constexpr char kExpiresOn[] = "expires_on";
constexpr char kAccessToken[] = "access_token";
constexpr char kRefreshToken[] = "refresh_token";
constexpr char kIDToken[] = "id_token";

// Error response: RFC 6749, section 5.2, and what Azure adds. Only the presence of "error" is checked.
constexpr char kError[] = "error";
constexpr char kErrorDescription[] = "error_description";
constexpr char kErrorCodes[] = "error_codes";
constexpr char kTimestamp[] = "timestamp";
constexpr char kTraceID[] = "trace_id";
constexpr char kCorrelationID[] = "correlation_id";

constexpr char kInvalidRequest[] = "invalid_request";
constexpr char kInvalidGrant[] = "invalid_grant";
constexpr char kUnauthorizedClient[] = "unauthorized_client";
constexpr char kInvalidClient[] = "invalid_client";
constexpr char kUnsupportedGrantType[] = "unsupported_grant_type";
constexpr char kInvalidResource[] = "invalid_resource";
constexpr char kInteractionRequired[] = "interaction_required";
constexpr char kTemporarilyUnavailable[] = "temporarily_unavailable";

}  // namespace TAVO::SSO

#endif
