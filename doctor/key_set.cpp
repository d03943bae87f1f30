#include "doctor/key_set.h"

#include <openssl/bn.h>
#include <openssl/evp.h>

#include <algorithm>
#include <memory>
#include <set>
#include <vector>

#include "web/text.h"

namespace Doctor {

namespace {

constexpr int kWeak = 2048;  // bits (RFC 7518, section 3.3)

struct FreeNumber {
    void operator()(BIGNUM *number) const { BN_free(number); }
};

std::vector<unsigned char> DecodeBase64Url(std::string text) {
    std::replace(text.begin(), text.end(), '-', '+');
    std::replace(text.begin(), text.end(), '_', '/');
    text.append((4 - text.size() % 4) % 4, '=');
    std::vector<unsigned char> bytes(text.size() / 4 * 3);
    const auto padding = static_cast<std::size_t>(std::count(text.begin(), text.end(), '='));
    const bool isBase64 = EVP_DecodeBlock(bytes.data(), reinterpret_cast<const unsigned char *>(text.data()),
                                          static_cast<int>(text.size())) >= 0;
    bytes.resize(isBase64 ? bytes.size() - std::min(padding, bytes.size()) : 0);
    return bytes;
}

/// The size of an RSA key's modulus in bits, 0 where that is not base64url.
int SizeOf(const Json::Value &key) {
    const std::vector<unsigned char> bytes = DecodeBase64Url(TAVO::Web::StringMember(key, "n"));
    const std::unique_ptr<BIGNUM, FreeNumber> modulus(BN_bin2bn(bytes.data(), static_cast<int>(bytes.size()), nullptr));
    return modulus ? BN_num_bits(modulus.get()) : 0;
}

std::string Describe(const Json::Value &key) {
    std::string text =
        "\"kid\" " + Quoted(TAVO::Web::StringMember(key, "kid")) + ", " + TAVO::Web::StringMember(key, "kty");
    if (const int bits = SizeOf(key); bits > 0) {
        text += ", " + std::to_string(bits) + " bits";
    }
    const std::string algorithm = TAVO::Web::StringMember(key, "alg");
    return algorithm.empty() ? text : text + ", " + algorithm;
}

/// What is wrong with a key for the library; empty if nothing is.
std::string FaultOf(const Json::Value &key) {
    if (!key.isObject()) {
        return "is no object";
    }
    if (!key["kid"].isString()) {
        return "has no \"kid\", by which a token could name it";
    }
    if (!key["n"].isString() || !key["e"].isString()) {
        return R"(is no RSA key: it lacks "n" or "e")";
    }
    if (SizeOf(key) == 0 || DecodeBase64Url(key["e"].asString()).empty()) {
        return "holds numbers that are not base64url";
    }
    return {};
}

}  // namespace

void CheckKeySet(Report &report, const Json::Value &keySet) {
    constexpr char kSet[] = "keys.set";
    constexpr char kSubject[] = "key set";
    const Json::Value keys = keySet.isObject() ? keySet["keys"] : Json::Value();
    if (!keys.isArray() || keys.empty()) {
        report.Finding(kSet, kSubject, "the answer has no list \"keys\", or none in it",
                       "ask the provider; is the discovery document theirs?");
        return;
    }
    std::set<std::string> kids;
    std::size_t usable = 0;
    for (const Json::Value &key : keys) {
        const std::string fault = FaultOf(key);
        if (!fault.empty()) {
            report.Note("keys.unusable", "unusable key", (key.isObject() ? Describe(key) + " " : "one ") + fault,
                        "a token that names it cannot be verified");
        } else if (!kids.insert(key["kid"].asString()).second) {
            report.Note("keys.duplicate", "key that is never reached",
                        Describe(key) + ": the first one of this \"kid\" is taken");
        } else {
            ++usable;
            report.Good("keys.key", "key", Describe(key));
            if (SizeOf(key) < kWeak) {
                report.Finding("keys.weak", "weak key", Describe(key), "ask the provider for one of 2048 bits or more");
            }
        }
    }
    const std::string found = std::to_string(usable) + " of " + std::to_string(keys.size()) + " keys can be used";
    if (usable == 0) {
        report.Finding(kSet, kSubject, found, "let the provider sign with RSA keys: no token can be verified");
    } else {
        report.Good(kSet, kSubject, found);
    }
}

}  // namespace Doctor
