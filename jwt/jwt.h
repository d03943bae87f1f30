/**
 * @file
 * Decodes and verifies JSON Web Tokens in compact serialisation (RFC 7519; RFC 7515, section 3.1).
 */
#ifndef TAVOSSO_JWT_JWT_H
#define TAVOSSO_JWT_JWT_H

#include <json/json.h>
#include <openssl/types.h>

#include <stdexcept>
#include <string>

#pragma GCC visibility push(default)

/** JSON Web Tokens. */
namespace TAVO::JWT {

/**
 * Base class of the failures of a verification. Only derived classes are thrown. A malformed token is
 * `std::invalid_argument`.
 */
class jwt_exception : public std::runtime_error {
  public:
    /** @param message  the text of `what()` */
    explicit jwt_exception(std::string message);
    ~jwt_exception() override;
};

/** The caller does not support the token's algorithm. */
class jwt_not_support : public jwt_exception {
  public:
    /** @param message  the text of `what()` */
    explicit jwt_not_support(std::string message);
    ~jwt_not_support() override;
};

/** The signature is wrong, or could not be verified. */
class jwt_verify_failed : public jwt_exception {
  public:
    /** @param message  the text of `what()` */
    explicit jwt_verify_failed(std::string message);
    ~jwt_verify_failed() override;
};

/**
 * A token, stored as its three encoded parts. No function changes the object or leaves entries in the calling thread's
 * OpenSSL error queue. Any function may throw `std::bad_alloc`.
 */
class Jwt {
  public:
    /**
     * Splits a token without decoding it.
     *
     * @param token  the compact token
     *
     * @throws std::invalid_argument  "bad jwt format!": not exactly three parts joined by dots
     */
    explicit Jwt(std::string token);
    ~Jwt();

    /**
     * Decodes the JOSE header. Each call parses it again.
     *
     * @return any JSON value, not only an object
     *
     * @throws std::invalid_argument  "bad jwt header format!": not JSON
     * @throws std::logic_error  (exactly this class) "empty jwt part": the part is empty, or memory ran out
     */
    Json::Value GetHeader();

    /**
     * Decodes the claims, unverified. Each call parses them again.
     *
     * @return any JSON value, not only an object
     *
     * @throws std::invalid_argument  "bad jwt body format!": not JSON
     * @throws std::logic_error  (exactly this class) "empty jwt part": the part is empty, or memory ran out
     */
    Json::Value GetBody();

    /** Returns the signature. @return base64url text, as in the token */
    std::string GetSignature();

    /**
     * Verifies the RSASSA-PKCS1-v1_5 signature (RFC 7518, section 3.3) over the first two parts. Ignores "alg" of the
     * header; the caller chooses the digest.
     *
     * @param n   the modulus: base64url text of a big-endian unsigned integer (RFC 7518, section 6.3.1.1); unchanged
     * @param e   the public exponent: the same (section 6.3.1.2); unchanged
     * @param md  the digest
     *
     * @throws jwt_verify_failed  "verify rsa signature failed", on any failure
     *
     * Logs at most one line, at `LOG_ERR`, and none if a part cannot be decoded:
     *  - "jwt:LINE EVP_PKEY_assign_RSA failed";
     *  - "jwt:LINE check key type failed";
     *  - "jwt:LINE EVP_DigestVerifyInit failed";
     *  - "jwt:LINE EVP_DigestVerifyUpdate failed";
     *  - "jwt:LINE EVP_DigestVerifyFinal failed": the signature is wrong.
     */
    void JwtRSAVerify(std::string &n, std::string &e, const EVP_MD *md);

    /**
     * Verifies the HMAC signature (RFC 7518, section 3.2) over the first two parts. Rejects a signature with "="
     * padding. Does not compare in constant time. Logs nothing.
     *
     * @param key  base64 or base64url text; an empty key is rejected; unchanged
     * @param md   the digest
     *
     * @throws jwt_verify_failed  "verify hmac signature failed", on any failure
     */
    void JwtHMACVerify(std::string &key, const EVP_MD *md);

  private:
    std::string header;
    std::string body;
    std::string signature;
};

}  // namespace TAVO::JWT

#pragma GCC visibility pop

#endif
