#include "tests/fuzz/oracle.h"

#include <openssl/bn.h>
#include <openssl/core_names.h>
#include <openssl/param_build.h>

#include <algorithm>
#include <memory>
#include <stdexcept>

#include "tests/support/encoding.h"
#include "tests/support/token.h"

#pragma GCC diagnostic ignored "-Wdeprecated-declarations"  // Json::Reader, which the library uses

namespace Fuzz {

namespace {

constexpr char kBase64[] = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
constexpr char kUnreserved[] = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789-._~";

template <typename Type>
using Owned = std::unique_ptr<Type, void (*)(Type *)>;

int SixBits(char c) {
    if (c >= 'A' && c <= 'Z') {
        return c - 'A';
    }
    if (c >= 'a' && c <= 'z') {
        return c - 'a' + 26;
    }
    if (c >= '0' && c <= '9') {
        return c - '0' + 52;
    }
    return c == '+' || c == '-' ? 62 : c == '/' || c == '_' ? 63 : -1;
}

bool IsSpace(char c) { return c == ' ' || c == '\t' || c == '\r' || c == '\n'; }

std::size_t Padding(const std::string &text) { return text.size() - (text.find_last_not_of('=') + 1); }

bool IsWellFormed(const std::string &text) {
    const std::size_t digits = text.size() - Padding(text);
    return text.find('=') >= digits && digits % 4 != 1 &&
           (digits == text.size() || (digits % 4 != 0 && text.size() == (digits + 3) / 4 * 4));
}

Owned<BIGNUM> Number(const std::string &bytes) {
    return {BN_bin2bn(reinterpret_cast<const unsigned char *>(bytes.data()), static_cast<int>(bytes.size()), nullptr),
            BN_free};
}

Owned<EVP_PKEY> PublicKey(const std::string &n, const std::string &e) {
    const Owned<BIGNUM> modulus = Number(n);
    const Owned<BIGNUM> exponent = Number(e);
    const Owned<OSSL_PARAM_BLD> builder(OSSL_PARAM_BLD_new(), OSSL_PARAM_BLD_free);
    OSSL_PARAM_BLD_push_BN(builder.get(), OSSL_PKEY_PARAM_RSA_N, modulus.get());
    OSSL_PARAM_BLD_push_BN(builder.get(), OSSL_PKEY_PARAM_RSA_E, exponent.get());
    const Owned<OSSL_PARAM> parameters(OSSL_PARAM_BLD_to_param(builder.get()), OSSL_PARAM_free);
    const Owned<EVP_PKEY_CTX> context(EVP_PKEY_CTX_new_from_name(nullptr, "RSA", nullptr), EVP_PKEY_CTX_free);
    EVP_PKEY *key = nullptr;
    if (EVP_PKEY_fromdata_init(context.get()) == 1) {
        EVP_PKEY_fromdata(context.get(), &key, EVP_PKEY_PUBLIC_KEY, parameters.get());
    }
    return {key, EVP_PKEY_free};
}

}  // namespace

std::string UpToNUL(const std::string &text) { return text.c_str(); }

std::vector<std::string> Split(const std::string &text, char separator) {
    std::vector<std::string> pieces(1);
    for (const char c : text) {
        if (c == separator) {
            pieces.emplace_back();
        } else {
            pieces.back() += c;
        }
    }
    return pieces;
}

Decoded DecodeBase64(const std::string &whole) {
    const std::string text = UpToNUL(whole);
    std::string digits;
    Decoded decoded;
    for (const char c : text) {
        if (SixBits(c) >= 0 || c == '=') {
            digits += c;
            continue;
        }
        decoded.wellFormed = false;
        if (!IsSpace(c)) {
            break;
        }
    }
    decoded.wellFormed = decoded.wellFormed && IsWellFormed(digits);
    digits.resize((digits.size() + 3) / 4 * 4, '=');
    unsigned int bits = 0;
    for (std::size_t i = 0; i < digits.size(); ++i) {
        bits = bits << 6 | static_cast<unsigned int>(std::max(SixBits(digits[i]), 0));
        if (i % 4 != 0) {
            decoded.bytes += static_cast<char>(bits >> (6 - 2 * (i % 4)) & 0xff);
        }
    }
    decoded.bytes.resize(decoded.bytes.size() - std::min<std::size_t>(Padding(digits), 2));
    return decoded;
}

std::string EncodeBase64(const std::string &bytes) {
    std::string text;
    for (std::size_t i = 0; i < bytes.size(); i += 3) {
        unsigned int bits = 0;
        for (std::size_t j = i; j < i + 3; ++j) {
            bits = bits << 8 | (j < bytes.size() ? static_cast<unsigned char>(bytes[j]) : 0U);
        }
        for (const unsigned int shift : {18U, 12U, 6U, 0U}) {
            text += kBase64[bits >> shift & 63U];
        }
    }
    for (std::size_t missing = (3 - bytes.size() % 3) % 3; missing > 0; --missing) {
        text[text.size() - missing] = '=';
    }
    return text;
}

std::optional<std::string> DecodeCanonicalBase64(const std::string &text) {
    const std::string bytes = DecodeBase64(text).bytes;
    return EncodeBase64(bytes) == text ? std::optional(bytes) : std::nullopt;
}

std::string PercentEncode(const std::string &text) {
    std::string encoded;
    for (const char c : UpToNUL(text)) {
        if (std::string(kUnreserved).find(c) != std::string::npos) {
            encoded += c;
        } else {
            char escape[4];
            std::snprintf(escape, sizeof escape, "%%%02X", static_cast<unsigned int>(static_cast<unsigned char>(c)));
            encoded += escape;
        }
    }
    return encoded;
}

std::optional<Json::Value> ParseJson(const std::string &text) {
    Json::Value document;
    try {
        if (Json::Reader().parse(text, document, true)) {
            return document;
        }
    } catch (const Json::Exception &) {
        // Nested too deeply: counts as malformed.
    }
    return std::nullopt;
}

const Json::Value *Member(const Json::Value &document, const std::string &name) {
    return document.isObject() && document.isMember(name) ? &document[name] : nullptr;
}

std::optional<std::string> StringMember(const Json::Value &document, const std::string &name) {
    const Json::Value *member = Member(document, name);
    return member != nullptr && member->isString() ? std::optional(member->asString()) : std::nullopt;
}

std::optional<std::string> TextMember(const Json::Value &document, const std::string &name) {
    const Json::Value *member = Member(document, name);
    if (member == nullptr) {
        return "";
    }
    return member->isConvertibleTo(Json::stringValue) ? std::optional(member->asString()) : std::nullopt;
}

bool RSAVerifies(const std::string &n, const std::string &e, const std::string &signature,
                 const std::string &signingInput, const EVP_MD *digest) {
    const Owned<EVP_PKEY> key = PublicKey(n, e);
    const Owned<EVP_MD_CTX> context(EVP_MD_CTX_new(), EVP_MD_CTX_free);
    return key && EVP_DigestVerifyInit(context.get(), nullptr, digest, nullptr, key.get()) == 1 &&
           EVP_DigestVerify(context.get(), reinterpret_cast<const unsigned char *>(signature.data()), signature.size(),
                            reinterpret_cast<const unsigned char *>(signingInput.data()), signingInput.size()) == 1;
}

std::string HMACSignature(const std::string &key, const std::string &signingInput, const EVP_MD *digest) {
    unsigned char mac[EVP_MAX_MD_SIZE];
    std::size_t length = 0;
    if (EVP_Q_mac(nullptr, "HMAC", nullptr, EVP_MD_get0_name(digest), nullptr, key.data(), key.size(),
                  reinterpret_cast<const unsigned char *>(signingInput.data()), signingInput.size(), mac, sizeof mac,
                  &length) == nullptr) {
        throw std::runtime_error("EVP_Q_mac");
    }
    return Test::Base64Url(std::string(reinterpret_cast<char *>(mac), length));
}

const EVP_MD *DigestOf(const std::string &algorithm, const std::string &family) {
    if (algorithm == family + "256") {
        return EVP_sha256();
    }
    if (algorithm == family + "384") {
        return EVP_sha384();
    }
    return algorithm == family + "512" ? EVP_sha512() : nullptr;
}

}  // namespace Fuzz
