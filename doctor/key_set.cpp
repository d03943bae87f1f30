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

/// Returns the size of an RSA key in bits; 0 if the modulus is not base64url.
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

/// Returns why the library cannot use a key, or an empty text.
std::string FaultOf(const Json::Value &key) {
    if (!key.isObject()) {
        return "is not an object";
    }
    if (!key["kid"].isString()) {
        return R"(has no "kid")";
    }
    if (!key["n"].isString() || !key["e"].isString()) {
        return R"(is not an RSA key: it has no "n" or no "e")";
    }
    if (SizeOf(key) == 0 || DecodeBase64Url(key["e"].asString()).empty()) {
        return R"(has an "n" or "e" that is not base64url)";
    }
    return {};
}

}  // namespace

void CheckKeySet(Report &report, const Json::Value &keySet) {
    constexpr char kSet[] = "keys.set";
    constexpr char kSubject[] = "key set";
    const Json::Value keys = keySet.isObject() ? keySet["keys"] : Json::Value();
    if (!keys.isArray() || keys.empty()) {
        report.Finding(kSet, kSubject, R"(the key set has no "keys", or an empty list)",
                       "Check that azure_wellknown is the address of your provider's discovery document.");
        return;
    }
    std::set<std::string> kids;
    std::size_t usable = 0;
    std::string faults;
    for (const Json::Value &key : keys) {
        const std::string fault = FaultOf(key);
        if (!fault.empty()) {
            const std::string found = (key.isObject() ? Describe(key) + " " : "one ") + fault;
            faults += "; " + found;
            report.Note("keys.unusable", "unusable key", found, "None. The library rejects tokens that name this key.");
        } else if (!kids.insert(key["kid"].asString()).second) {
            report.Note("keys.duplicate", "repeated key",
                        Describe(key) + ": the library uses the first key of this \"kid\"");
        } else {
            ++usable;
            report.Good("keys.key", "key", Describe(key));
            if (SizeOf(key) < kWeak) {
                report.Finding("keys.weak", "weak key", Describe(key),
                               "Ask the provider for a key of at least 2048 bits.");
            }
        }
    }
    const std::string found = std::to_string(usable) + " of " + std::to_string(keys.size()) + " keys are usable";
    if (usable == 0) {
        report.Finding(kSet, kSubject, found + faults,
                       R"(Configure the provider to publish RSA keys with "kid", and to sign with them.)");
    } else {
        report.Good(kSet, kSubject, found);
    }
}

}  // namespace Doctor
