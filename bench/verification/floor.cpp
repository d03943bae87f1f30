// The floor: the calls of Boost, libcrypto and jsoncpp that a verification needs, in the library's order, for valid
// input. It does not check for errors, overwrite secrets, or copy text unnecessarily.
#include <alloca.h>
#include <json/json.h>
#include <openssl/bio.h>
#include <openssl/bn.h>
#include <openssl/evp.h>
#include <openssl/hmac.h>
#include <openssl/rsa.h>

#include <algorithm>
#include <boost/algorithm/string/classification.hpp>
#include <boost/algorithm/string/split.hpp>
#include <cstdlib>
#include <string>
#include <string_view>
#include <vector>

#include "bench/verification/verifiers.h"

#pragma GCC diagnostic ignored "-Wdeprecated-declarations"

namespace Bench {

namespace {

struct Bytes {
    unsigned char *data;
    int length;
};

BIO *Base64Filter(BIO *end) {
    BIO *filter = BIO_new(BIO_f_base64());
    BIO_set_flags(filter, BIO_FLAGS_BASE64_NO_NL);
    return BIO_push(filter, end);
}

Bytes Decode(std::string_view text) {
    char *scratch = static_cast<char *>(alloca(text.size() + 4));
    std::transform(text.begin(), text.end(), scratch, [](char c) { return c == '-' ? '+' : c == '_' ? '/' : c; });
    std::size_t length = text.size();
    while (length % 4 != 0) {
        scratch[length++] = '=';
    }
    BIO *chain = Base64Filter(BIO_new_mem_buf(scratch, static_cast<int>(length)));
    const int pending = static_cast<int>(BIO_pending(chain));
    auto *decoded = static_cast<unsigned char *>(std::malloc(static_cast<std::size_t>(pending) + 1));
    const Bytes bytes{decoded, BIO_read(chain, decoded, pending)};
    BIO_free_all(chain);
    return bytes;
}

Json::Value Parse(const char *begin, std::size_t length) {
    Json::Value value;
    Json::Reader().parse(begin, begin + length, value, true);
    return value;
}

Json::Value ParsePart(std::string_view part) {
    const Bytes bytes = Decode(part);
    Json::Value value = Parse(reinterpret_cast<const char *>(bytes.data), static_cast<std::size_t>(bytes.length));
    std::free(bytes.data);
    return value;
}

std::string_view Text(const Json::Value &object, const char *name) {
    const char *begin = nullptr;
    const char *end = nullptr;
    object[name].getString(&begin, &end);
    return {begin, static_cast<std::size_t>(end - begin)};
}

bool VerifyRSA(std::string_view input, std::string_view signature, const Json::Value &jwk) {
    const Bytes n = Decode(Text(jwk, "n"));
    const Bytes e = Decode(Text(jwk, "e"));
    const Bytes signatureBytes = Decode(signature);
    RSA *rsa = RSA_new();
    RSA_set0_key(rsa, BN_bin2bn(n.data, n.length, nullptr), BN_bin2bn(e.data, e.length, nullptr), nullptr);
    EVP_PKEY *key = EVP_PKEY_new();
    EVP_PKEY_assign(key, EVP_PKEY_RSA, rsa);
    EVP_MD_CTX *context = EVP_MD_CTX_new();
    EVP_DigestVerifyInit(context, nullptr, EVP_sha256(), nullptr, key);
    EVP_DigestUpdate(context, input.data(), input.size());
    const bool verified =
        EVP_DigestVerifyFinal(context, signatureBytes.data, static_cast<std::size_t>(signatureBytes.length)) == 1;
    EVP_MD_CTX_free(context);
    EVP_PKEY_free(key);
    std::free(n.data);
    std::free(e.data);
    std::free(signatureBytes.data);
    return verified;
}

bool VerifyHMAC(std::string_view input, std::string_view signature, std::string_view secret) {
    const Bytes key = Decode(secret);
    BIO *sink = BIO_new(BIO_s_mem());
    BIO *chain = Base64Filter(sink);
    unsigned char mac[EVP_MAX_MD_SIZE];
    unsigned int macLength = 0;
    HMAC(EVP_sha256(), key.data, key.length, reinterpret_cast<const unsigned char *>(input.data()), input.size(), mac,
         &macLength);
    BIO_write(chain, mac, static_cast<int>(macLength));
    BIO_flush(chain);
    char text[2 * EVP_MAX_MD_SIZE];
    const int textLength = BIO_read(sink, text, static_cast<int>(BIO_pending(sink)));
    std::size_t length = 0;
    for (const char c : std::string_view(text, static_cast<std::size_t>(textLength))) {
        if (c != '=') {
            text[length++] = c == '/' ? '_' : c == '+' ? '-' : c;
        }
    }
    std::free(key.data);
    BIO_free_all(chain);
    return std::string_view(text, length) == signature;
}

}  // namespace

bool VerifyByFloor(const SignedToken &token) {
    std::vector<std::string> parts;
    boost::split(parts, token.compact, boost::is_any_of("."));
    const std::string_view input(token.compact.data(), parts[0].size() + 1 + parts[1].size());
    const Json::Value header = ParsePart(parts[0]);
    const Json::Value claims = ParsePart(parts[1]);
    return token.algorithm == Algorithm::kRS256 ? VerifyRSA(input, parts[2], Parse(token.jwk.data(), token.jwk.size()))
                                                : VerifyHMAC(input, parts[2], token.secret);
}

}  // namespace Bench
