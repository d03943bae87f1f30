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

#include "utils/cleanse.h"
#include "utils/error_queue.h"
#include "utils/json.h"
#include "utils/source_line.h"

namespace TAVO::JWT {

namespace {

constexpr char kSourceName[] = "jwt";

template <auto function>
struct ReleaseWith {
    template <typename T>
    void operator()(T *object) const {
        function(object);
    }
};

/// Decoded bytes, of a key or of a token: cleansed on release.
struct ReleaseBytes {
    std::size_t size = 0;
    void operator()(unsigned char *bytes) const {
        explicit_bzero(bytes, size);
        std::free(bytes);
    }
};

using Bytes = std::unique_ptr<unsigned char, ReleaseBytes>;
using BIOPointer = std::unique_ptr<BIO, ReleaseWith<BIO_free_all>>;
using BigNumber = std::unique_ptr<BIGNUM, ReleaseWith<BN_free>>;
using DigestContext = std::unique_ptr<EVP_MD_CTX, ReleaseWith<EVP_MD_CTX_free>>;
using PublicKey = std::unique_ptr<EVP_PKEY, ReleaseWith<EVP_PKEY_free>>;

/// Room for a text: on the stack while it is small, as tokens are, and elsewhere when a provider sends a large one.
/// Cleansed on release, as the text may be a key.
class ScratchText {
  public:
    explicit ScratchText(std::size_t size)
        : large_(size > sizeof small_ ? std::make_unique<char[]>(size) : nullptr),
          text_(large_ ? large_.get() : small_),
          cleanse_(text_, size) {}
    char *get() { return text_; }

  private:
    char small_[4096];
    std::unique_ptr<char[]> large_;
    char *text_;
    Utils::CleanseOnExit cleanse_;
};

/// A base64 filter on top of a source or sink, which it takes over.
BIOPointer PushBase64Filter(BIOPointer filter, BIOPointer end) {
    BIO_set_flags(filter.get(), BIO_FLAGS_BASE64_NO_NL);
    BIO_push(filter.get(), end.release());
    return filter;
}

/// The character of standard base64 that stands for one of base64url (RFC 4648, section 5).
char StandardCharacter(char c) { return c == '-' ? '+' : c == '_' ? '/' : c; }

/// Decodes one base64url part of a token (RFC 7515, section 2), or standard base64. Returns the bytes with a NUL behind
/// them and writes their number, which is 0 or less where the text is not base64. Null, and no number, when the part is
/// empty or memory runs out.
Bytes Base64UrlDecode(const char *part, int *length) {
    const std::size_t partLength = std::strlen(part);
    const std::size_t padding = (4 - partLength % 4) % 4;
    if (partLength + padding > INT_MAX) {
        return nullptr;  // OpenSSL counts in int. GCOVR_EXCL_LINE: takes a text of 2 GB
    }
    ScratchText scratch(partLength + padding + 1);
    char *end = std::transform(part, part + partLength, scratch.get(), StandardCharacter);
    end = std::fill_n(end, padding, '=');
    *end = '\0';

    const int textLength = static_cast<int>(end - scratch.get());
    BIOPointer filter(BIO_new(BIO_f_base64()));
    BIOPointer source(BIO_new_mem_buf(scratch.get(), textLength));
    if (!filter || !source) {
        return nullptr;
    }
    const BIOPointer chain = PushBase64Filter(std::move(filter), std::move(source));
    const long pending = BIO_pending(chain.get());
    if (pending <= 0) {
        return nullptr;
    }
    const std::size_t size = static_cast<std::size_t>(pending) + 1;
    Bytes decoded(static_cast<unsigned char *>(std::malloc(size)), ReleaseBytes{size});
    if (!decoded) {
        return nullptr;
    }
    *length = BIO_read(chain.get(), decoded.get(), static_cast<int>(pending));
    decoded.get()[*length > 0 ? *length : 0] = '\0';
    return decoded;
}

/// A decoded part; empty when the part did not decode, which is also the case when it decodes to nothing: an empty key
/// would let anyone sign.
struct DecodedPart {
    explicit DecodedPart(const std::string &part) : bytes(Base64UrlDecode(part.c_str(), &length)) {}
    explicit operator bool() const { return bytes && length > 0; }

    int length = 0;
    Bytes bytes;
};

/// The JSON value that a part encodes. Throws std::invalid_argument with that message if it is not JSON.
Json::Value ParsePart(const std::string &part, const char *notJson) {
    const Utils::KeepErrorQueue keepErrorQueue;
    int length = 0;
    const Bytes decoded = Base64UrlDecode(part.c_str(), &length);
    if (!decoded) {
        throw std::logic_error("empty jwt part");
    }
    Json::Value value;
    if (!Utils::ParseJson(reinterpret_cast<const char *>(decoded.get()), value)) {
        throw std::invalid_argument(notJson);
    }
    return value;
}

// The low-level RSA calls are marked deprecated in OpenSSL 3; older generations have no others.
#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Wdeprecated-declarations"

struct ReleaseRSA {
    void operator()(RSA *rsa) const { RSA_free(rsa); }
};
using RSAPointer = std::unique_ptr<RSA, ReleaseRSA>;

BigNumber MakeBigNumber(const DecodedPart &part) {
    return BigNumber(BN_bin2bn(part.bytes.get(), part.length, nullptr));
}

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

/// The public key of modulus and exponent; null when it cannot be made.
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

/// What is signed (RFC 7515, section 5.2).
std::string SigningInput(const std::string &header, const std::string &body) {
    std::string input;
    input.reserve(header.size() + 1 + body.size());  // if it had to grow, it would leave pieces behind
    input += header;
    input += '.';
    input += body;
    return input;
}

bool VerifyRSA(const std::string &signingInput, const std::string &n, const std::string &e,
               const std::string &signature, const EVP_MD *md) {
    const Utils::KeepErrorQueue keepErrorQueue;
    const DecodedPart modulus(n);
    const DecodedPart exponent(e);
    const DecodedPart signatureBytes(signature);
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
                              static_cast<std::size_t>(signatureBytes.length)) != 1) {
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
    const DecodedPart keyBytes(key);
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
    const Utils::CleanseOnExit cleanseMAC(mac, sizeof mac);  // of a forged token, its true signature
    unsigned int macLength = 0;
    if (HMAC(md, keyBytes.bytes.get(), keyBytes.length, reinterpret_cast<const unsigned char *>(signingInput.c_str()),
             std::strlen(signingInput.c_str()), mac, &macLength) == nullptr) {
        return false;
    }
    // A MAC of which nothing arrived would match an empty signature.
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

// The destructors stand here so that each class has its type information in this library, once: that is how a program
// catches by type what was thrown in here.

jwt_exception::jwt_exception(std::string message) : std::runtime_error(message) {}
jwt_exception::~jwt_exception() = default;

jwt_not_support::jwt_not_support(std::string message) : jwt_exception(std::move(message)) {}
jwt_not_support::~jwt_not_support() = default;

jwt_verify_failed::jwt_verify_failed(std::string message) : jwt_exception(std::move(message)) {}
jwt_verify_failed::~jwt_verify_failed() = default;

Jwt::Jwt(std::string token) {
    const Utils::CleanseTextOnExit cleanse(token);
    // Not into a list of pieces: those of a provider's 30 MB of dots would take gigabytes.
    const std::size_t headerEnd = token.find('.');
    const std::size_t bodyEnd = token.find('.', headerEnd + 1);
    if (bodyEnd == std::string::npos || token.find('.', bodyEnd + 1) != std::string::npos) {
        throw std::invalid_argument("bad jwt format!");
    }
    header = token.substr(0, headerEnd);
    body = token.substr(headerEnd + 1, bodyEnd - headerEnd - 1);
    signature = token.substr(bodyEnd + 1);
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
