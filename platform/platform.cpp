// A working stand-in for the appliance's libraries, for machines that are not the appliance.
#include "platform/platform.h"

#include <json/json.h>
#include <openssl/evp.h>

#include <algorithm>
#include <boost/algorithm/string/predicate.hpp>
#include <fstream>
#include <limits>
#include <locale>
#include <string>

namespace {

/// DNS domain names and their NetBIOS names: a JSON object of strings.
constexpr char kDomainTable[] = "/usr/tavo/etc/domains.conf";

constexpr std::size_t kLongestInput = std::numeric_limits<int>::max() / 2;  // OpenSSL's coder counts in int

bool IsUnreserved(char c) {
    return (c >= 'A' && c <= 'Z') || (c >= 'a' && c <= 'z') || (c >= '0' && c <= '9') || c == '-' || c == '.' ||
           c == '_' || c == '~';
}

std::string PercentEncode(const char *text) {
    constexpr char kDigits[] = "0123456789ABCDEF";
    std::string encoded;
    for (; *text != '\0'; ++text) {
        if (IsUnreserved(*text)) {
            encoded += *text;
        } else {
            const auto byte = static_cast<unsigned char>(*text);
            encoded += {'%', kDigits[byte >> 4], kDigits[byte & 15]};
        }
    }
    return encoded;
}

std::string EncodeBase64(const std::string &bytes) {
    std::string text(4 * ((bytes.size() + 2) / 3), '\0');
    EVP_EncodeBlock(reinterpret_cast<unsigned char *>(text.data()),
                    reinterpret_cast<const unsigned char *>(bytes.data()), static_cast<int>(bytes.size()));
    return text;
}

/// The bytes of a canonical base64 text: the one text that encodes them, nothing skipped and no bit left over.
bool DecodeBase64(const std::string &text, std::string &bytes) {
    if (text.size() % 4 != 0) {
        return false;
    }
    bytes.resize(3 * text.size() / 4);
    if (EVP_DecodeBlock(reinterpret_cast<unsigned char *>(bytes.data()),
                        reinterpret_cast<const unsigned char *>(text.data()), static_cast<int>(text.size())) < 0) {
        return false;
    }
    // The coder counts padding as zero bytes, and is lenient about what surrounds the text.
    if (!text.empty()) {
        bytes.resize(bytes.size() - (text.back() == '=' ? 1 : 0) - (text[text.size() - 2] == '=' ? 1 : 0));
    }
    return EncodeBase64(bytes) == text;
}

bool FindNetBIOSName(const std::string &domain, std::string &netBIOSName) {
    std::ifstream file(kDomainTable);
    Json::Value table;
    if (!Json::parseFromStream(Json::CharReaderBuilder(), file, &table, nullptr) || !table.isObject()) {
        return false;
    }
    for (const std::string &name : table.getMemberNames()) {
        if (boost::iequals(name, domain, std::locale::classic()) && table[name].isString()) {
            netBIOSName = table[name].asString();
            return !netBIOSName.empty();
        }
    }
    return false;
}

bool ConvertDomain(const std::string &name, std::string &converted) {
    const std::size_t backslash = name.find('\\');
    if (backslash == std::string::npos || !FindNetBIOSName(name.substr(0, backslash), converted)) {
        return false;
    }
    converted += name.substr(backslash);
    return true;
}

/// Copies a text and its NUL into a buffer that holds `usableSize` characters and the NUL.
bool CopyText(const std::string &text, char *dst, std::size_t usableSize) {
    if (text.size() > usableSize) {
        return false;
    }
    std::copy_n(text.c_str(), text.size() + 1, dst);
    return true;
}

}  // namespace

// No exception may leave a function with C linkage: want of memory is one more failure.

int TavoCgiURLEncode(const char *src, char *dst, size_t size) try {
    if (src == nullptr || dst == nullptr) {
        return -1;
    }
    return CopyText(PercentEncode(src), dst, size) ? 0 : -1;
} catch (const std::exception &) {
    return -1;
}

int TLIBCBase64SzEncodeFull(const char *src, size_t len, char *dst, int /*flag1*/, size_t size, int /*flag2*/,
                            int /*flag3*/) try {
    if ((src == nullptr && len != 0) || dst == nullptr || size == 0 || len > kLongestInput) {
        return 0;
    }
    return CopyText(EncodeBase64(std::string(src, len)), dst, size - 1) ? 1 : 0;
} catch (const std::exception &) {
    return 0;
}

int TLIBCBase64Decode(const char *src, size_t len, char *dst, size_t *len_inout) try {
    std::string bytes;
    if ((src == nullptr && len != 0) || dst == nullptr || len_inout == nullptr || len > kLongestInput ||
        !DecodeBase64(std::string(src, len), bytes) || bytes.size() > *len_inout) {
        return 0;
    }
    std::copy(bytes.begin(), bytes.end(), dst);
    *len_inout = bytes.size();
    return 1;
} catch (const std::exception &) {
    return 0;
}

int TAVOWinsUserNameFqdn2Netbios(const char *src, char *dst, size_t size) try {
    std::string converted;
    if (src == nullptr || dst == nullptr || !ConvertDomain(src, converted)) {
        return -1;
    }
    return CopyText(converted, dst, size) ? 0 : -1;
} catch (const std::exception &) {
    return -1;
}
