#include "jwt/jwt.h"

#include <openssl/bio.h>
#include <openssl/bn.h>
#include <openssl/evp.h>
#include <openssl/hmac.h>
#include <openssl/rsa.h>
#include <syslog.h>

#include <algorithm>
#include <climits>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <utility>
#include <vector>

#include "utils/cleanse.h"
#include "utils/error_queue.h"
#include "utils/json.h"
#include "utils/source_line.h"
#include "utils/split.h"

namespace TAVO::JWT {

namespace {

constexpr char kSourceName[] = "jwt";

constexpr std::size_t kScratchOnStack = 4096;  // in bytes; larger parts are decoded on the heap

template <auto function>
struct ReleaseWith {
    template <typename T>
    void operator()(T *object) const {
        function(object);
    }
};

/// Overwrites the bytes before it frees them; they may be a key or a token.
struct ReleaseBytes {
    std::size_t room = 0;
    void operator()(unsigned char *bytes) const {
        explicit_bzero(bytes, room);
        std::free(bytes);
    }
};

using Bytes = std::unique_ptr<unsigned char, ReleaseBytes>;
using BIOPointer = std::unique_ptr<BIO, ReleaseWith<BIO_free_all>>;
using BigNumber = std::unique_ptr<BIGNUM, ReleaseWith<BN_free>>;
using DigestContext = std::unique_ptr<EVP_MD_CTX, ReleaseWith<EVP_MD_CTX_free>>;
using PublicKey = std::unique_ptr<EVP_PKEY, ReleaseWith<EVP_PKEY_free>>;

struct DecodedPart {
    /// False for an empty result, too: anyone could sign with an empty key.
    explicit operator bool() const { return bytes && size > 0; }

    Bytes bytes;   // followed by a NUL; null if the part is empty or memory runs out
    int size = 0;  // 0 or less if the part is not base64
};

/// Pushes a base64 filter onto a source or sink. The result owns both.
BIOPointer PushBase64Filter(BIOPointer filter, BIOPointer end) {
    BIO_set_flags(filter.get(), BIO_FLAGS_BASE64_NO_NL);
    BIO_push(filter.get(), end.release());
    return filter;
}

DecodedPart Base64Decode(const char *text, int length) {
    BIOPointer filter(BIO_new(BIO_f_base64()));
    BIOPointer source(BIO_new_mem_buf(text, length));
    if (!filter || !source) {
        return {};
    }
    const BIOPointer chain = PushBase64Filter(std::move(filter), std::move(source));
    const long pending = BIO_pending(chain.get());
    if (pending <= 0) {
        return {};
    }
    const std::size_t room = static_cast<std::size_t>(pending) + 1;
    Bytes bytes(static_cast<unsigned char *>(std::malloc(room)), ReleaseBytes{room});
    if (!bytes) {
        return {};
    }
    const int size = BIO_read(chain.get(), bytes.get(), static_cast<int>(pending));
    bytes.get()[std::max(size, 0)] = '\0';
    return {std::move(bytes), size};
}

/// Converts a character of base64url (RFC 4648, section 5) to standard base64.
char StandardCharacter(char c) { return c == '-' ? '+' : c == '_' ? '/' : c; }

/// Decodes one part of a token: base64url (RFC 7515, section 2) or standard base64.
DecodedPart Base64UrlDecode(const char *part) {
    const std::size_t partLength = std::strlen(part);
    const std::size_t padding = (4 - partLength % 4) % 4;
    const std::size_t length = partLength + padding;
    if (length > INT_MAX) {
        return {};  // OpenSSL counts in int. GCOVR_EXCL_LINE: needs a text of 2 GB
    }
    char small[kScratchOnStack];
    std::unique_ptr<char[]> large;
    char *text = small;
    if (length >= sizeof small) {
        large = std::make_unique<char[]>(length + 1);
        text = large.get();
    }
    const Utils::CleanseOnExit cleanse(text, length + 1);  // the part may be a key
    std::transform(part, part + partLength, text, StandardCharacter);
    std::fill_n(text + partLength, padding, '=');
    text[length] = '\0';
    return Base64Decode(text, static_cast<int>(length));
}

/// Decodes a part. Throws std::invalid_argument with the text `notJson` if it is not JSON.
Json::Value ParsePart(const std::string &part, const char *notJson) {
    const Utils::KeepErrorQueue keepErrorQueue;
    const DecodedPart decoded = Base64UrlDecode(part.c_str());
    if (!decoded.bytes) {
        throw std::logic_error("empty jwt part");
    }
    Json::Value value;
    if (!Utils::ParseJson(reinterpret_cast<const char *>(decoded.bytes.get()), value)) {
        throw std::invalid_argument(notJson);
    }
    return value;
}

// Deprecated in OpenSSL 3; older versions have only these calls.
#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Wdeprecated-declarations"

struct ReleaseRSA {
    void operator()(RSA *rsa) const { RSA_free(rsa); }
};
using RSAPointer = std::unique_ptr<RSA, ReleaseRSA>;

BigNumber MakeBigNumber(const DecodedPart &part) { return BigNumber(BN_bin2bn(part.bytes.get(), part.size, nullptr)); }

RSAPointer MakeRSA(const DecodedPart &n, const DecodedPart &e) {
    BigNumber modulus = MakeBigNumber(n);
    BigNumber exponent = MakeBigNumber(e);
    if (!modulus || !exponent) {
        return nullptr;
    }
    RSAPointer rsa(RSA_new());
    if (!rsa || RSA_set0_key(rsa.get(), modulus.get(), exponent.get(), nullptr) != 1) {
        return nullptr;
    }
    static_cast<void>(modulus.release());
    static_cast<void>(exponent.release());
    return rsa;
}

/// Returns the public key, or null on failure.
PublicKey MakePublicKey(const DecodedPart &n, const DecodedPart &e) {
    RSAPointer rsa = MakeRSA(n, e);
    if (!rsa) {
        return nullptr;
    }
    PublicKey key(EVP_PKEY_new());
    if (!key) {
        return nullptr;
    }
    if (EVP_PKEY_assign(key.get(), EVP_PKEY_RSA, rsa.get()) != 1) {
        syslog(LOG_ERR, "%s:%d EVP_PKEY_assign_RSA failed", SOURCE_LINE);
        return nullptr;
    }
    static_cast<void>(rsa.release());
    if (EVP_PKEY_id(key.get()) != EVP_PKEY_RSA) {
        syslog(LOG_ERR, "%s:%d check key type failed", SOURCE_LINE);
        return nullptr;
    }
    return key;
}

#pragma GCC diagnostic pop

/// Returns the signed text (RFC 7515, section 5.2).
std::string SigningInput(const std::string &header, const std::string &body) {
    std::string input;
    input.reserve(header.size() + 1 + body.size());  // growth would leave copies of the token in released memory
    input += header;
    input += '.';
    input += body;
    return input;
}

bool VerifyRSA(const std::string &signingInput, const std::string &n, const std::string &e,
               const std::string &signature, const EVP_MD *md) {
    const Utils::KeepErrorQueue keepErrorQueue;
    const DecodedPart modulus = Base64UrlDecode(n.c_str());
    const DecodedPart exponent = Base64UrlDecode(e.c_str());
    const DecodedPart signatureBytes = Base64UrlDecode(signature.c_str());
    if (!modulus || !exponent || !signatureBytes) {
        return false;
    }
    const PublicKey key = MakePublicKey(modulus, exponent);
    if (!key) {
        return false;
    }
    const DigestContext context(EVP_MD_CTX_new());
    if (!context) {
        return false;
    }
    if (EVP_DigestVerifyInit(context.get(), nullptr, md, nullptr, key.get()) != 1) {
        syslog(LOG_ERR, "%s:%d EVP_DigestVerifyInit failed", SOURCE_LINE);
        return false;
    }
    if (EVP_DigestUpdate(context.get(), signingInput.c_str(), std::strlen(signingInput.c_str())) != 1) {
        syslog(LOG_ERR, "%s:%d EVP_DigestVerifyUpdate failed", SOURCE_LINE);
        return false;
    }
    if (EVP_DigestVerifyFinal(context.get(), signatureBytes.bytes.get(),
                              static_cast<std::size_t>(signatureBytes.size)) != 1) {
        syslog(LOG_ERR, "%s:%d EVP_DigestVerifyFinal failed", SOURCE_LINE);
        return false;
    }
    return true;
}

/// Turns standard base64 into base64url without padding.
void MakeBase64Url(char *text) {
    char *end = text;
    for (const char *c = text; *c != '\0'; ++c) {
        if (*c != '=') {
            *end++ = *c == '/' ? '_' : *c == '+' ? '-' : *c;
        }
    }
    *end = '\0';
}

bool VerifyHMAC(const std::string &signingInput, const std::string &key, const std::string &signature,
                const EVP_MD *md) {
    const Utils::KeepErrorQueue keepErrorQueue;
    const DecodedPart keyBytes = Base64UrlDecode(key.c_str());
    if (!keyBytes) {
        return false;
    }
    BIOPointer filter(BIO_new(BIO_f_base64()));
    if (!filter) {
        return false;
    }
    BIOPointer sink(BIO_new(BIO_s_mem()));
    if (!sink) {
        return false;
    }
    BIO *encoded = sink.get();
    const BIOPointer chain = PushBase64Filter(std::move(filter), std::move(sink));

    unsigned char mac[EVP_MAX_MD_SIZE] = {};
    const Utils::CleanseOnExit cleanseMAC(mac, sizeof mac);  // for a forged token, this is the valid signature
    unsigned int macLength = 0;
    if (HMAC(md, keyBytes.bytes.get(), keyBytes.size, reinterpret_cast<const unsigned char *>(signingInput.c_str()),
             std::strlen(signingInput.c_str()), mac, &macLength) == nullptr) {
        return false;
    }
    // An empty text would match an empty signature.
    if (BIO_write(chain.get(), mac, static_cast<int>(macLength)) != static_cast<int>(macLength) ||
        BIO_flush(chain.get()) != 1) {
        return false;
    }
    char text[2 * EVP_MAX_MD_SIZE] = {};
    const Utils::CleanseOnExit cleanseText(text, sizeof text);
    const long pending = BIO_pending(encoded);
    if (pending <= 0 || pending >= static_cast<long>(sizeof text) ||
        BIO_read(encoded, text, static_cast<int>(pending)) != pending) {
        return false;
    }
    MakeBase64Url(text);
    return std::strcmp(text, signature.c_str()) == 0;
}

}  // namespace

// Out of line: programs catch these by type, so the type information must be in this library only.

jwt_exception::jwt_exception(std::string message) : std::runtime_error(message) {}
jwt_exception::~jwt_exception() = default;

jwt_not_support::jwt_not_support(std::string message) : jwt_exception(std::move(message)) {}
jwt_not_support::~jwt_not_support() = default;

jwt_verify_failed::jwt_verify_failed(std::string message) : jwt_exception(std::move(message)) {}
jwt_verify_failed::~jwt_verify_failed() = default;

Jwt::Jwt(std::string token) {
    const Utils::CleanseTextOnExit cleanse(token);
    std::vector<std::string> parts = Utils::SplitInto(3, token, '.');
    if (parts.empty()) {
        throw std::invalid_argument("bad jwt format!");
    }
    header = std::move(parts[0]);
    body = std::move(parts[1]);
    signature = std::move(parts[2]);
}

Jwt::~Jwt() {
    Utils::Cleanse(body);
    Utils::Cleanse(signature);
}

Json::Value Jwt::GetHeader() { return ParsePart(header, "bad jwt header format!"); }
Json::Value Jwt::GetBody() { return ParsePart(body, "bad jwt body format!"); }
std::string Jwt::GetSignature() { return signature; }

void Jwt::JwtRSAVerify(std::string &n, std::string &e, const EVP_MD *md) {
    std::string signingInput = SigningInput(header, body);
    const Utils::CleanseTextOnExit cleanse(signingInput);
    if (!VerifyRSA(signingInput, n, e, signature, md)) {
        throw jwt_verify_failed("verify rsa signature failed");
    }
}

void Jwt::JwtHMACVerify(std::string &key, const EVP_MD *md) {
    std::string signingInput = SigningInput(header, body);
    const Utils::CleanseTextOnExit cleanse(signingInput);
    if (!VerifyHMAC(signingInput, key, signature, md)) {
        throw jwt_verify_failed("verify hmac signature failed");
    }
}

}  // namespace TAVO::JWT
