/**
 * @file
 * JSON Web Tokens in compact serialisation (RFC 7519; RFC 7515, section 3.1): reading one and checking its signature.
 */
#ifndef TAVOSSO_JWT_JWT_H
#define TAVOSSO_JWT_JWT_H

#include <json/json.h>
#include <openssl/types.h>

#include <stdexcept>
#include <string>

#pragma GCC visibility push(default)

/** The token format that ID tokens have. */
namespace TAVO::JWT {

/** Root of the token failures; only classes derived from it are thrown. Malformed tokens are `std::invalid_argument`,
 * not of this kind.
 */
class jwt_exception : public std::runtime_error {
  public:
    /** @param message  the text that `what()` gives */
    explicit jwt_exception(std::string message);
    ~jwt_exception() override;
};

/** The token's algorithm is none that the caller supports. */
class jwt_not_support : public jwt_exception {
  public:
    /** @param message  the text that `what()` gives */
    explicit jwt_not_support(std::string message);
    ~jwt_not_support() override;
};

/** The signature does not verify, or a step of the check failed. */
class jwt_verify_failed : public jwt_exception {
  public:
    /** @param message  the text that `what()` gives */
    explicit jwt_verify_failed(std::string message);
    ~jwt_verify_failed() override;
};

/**
 * One token, kept as its three parts, undecoded. No function changes the object, and none leaves an entry on the
 * calling thread's OpenSSL error queue. Any may also throw `std::bad_alloc` when memory runs out.
 */
class Jwt {
  public:
    /**
     * Splits a token.
     *
     * @param token  the compact token; nothing is decoded or checked here but the number of its parts
     *
     * @throws std::invalid_argument  "bad jwt format!": not exactly three parts joined by dots
     */
    explicit Jwt(std::string token);
    ~Jwt();

    /**
     * Decodes the JOSE header.
     *
     * @return the header, parsed afresh: any JSON value, not only an object
     *
     * @throws std::invalid_argument  "bad jwt header format!": not JSON
     * @throws std::logic_error  (exactly this class) "empty jwt part": the part is empty, or memory runs out over it
     */
    Json::Value GetHeader();

    /**
     * Decodes the claims, unverified.
     *
     * @return the claims, parsed afresh: any JSON value, not only an object
     *
     * @throws std::invalid_argument  "bad jwt body format!": not JSON
     * @throws std::logic_error  (exactly this class) "empty jwt part": the part is empty, or memory runs out over it
     */
    Json::Value GetBody();

    /** Gives the signature part. @return as it stands in the token: base64url text */
    std::string GetSignature();

    /**
     * Checks an RSA signature, RSASSA-PKCS1-v1_5 (RFC 7518, section 3.3), over the first two parts as they stand.
     * Returns if it verifies. Does not look at the header's "alg": choosing the digest is the caller's business.
     *
     * @param n   the modulus: base64url text of a big-endian unsigned integer (RFC 7518, section 6.3.1.1); unchanged
     * @param e   the public exponent, likewise (section 6.3.1.2); unchanged
     * @param md  the digest
     *
     * @throws jwt_verify_failed  "verify rsa signature failed", on any failure
     *
     * Log lines, at `LOG_ERR`, at most one: "jwt:LINE EVP_PKEY_assign_RSA failed", "jwt:LINE check key type failed",
     * "jwt:LINE EVP_DigestVerifyInit failed", "jwt:LINE EVP_DigestVerifyUpdate failed", "jwt:LINE
     * EVP_DigestVerifyFinal failed" (the signature is wrong). A part that does not decode is not logged.
     */
    void JwtRSAVerify(std::string &n, std::string &e, const EVP_MD *md);

    /**
     * Checks an HMAC signature (RFC 7518, section 3.2) over the first two parts as they stand. Returns if it verifies;
     * logs nothing. The texts are compared plainly, not in constant time; a signature with "=" padding never matches.
     *
     * @param key  the key: base64 or base64url text; the empty key is refused; unchanged
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
