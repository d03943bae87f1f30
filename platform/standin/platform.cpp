// A working stand-in for the appliance's libraries, for other machines.
#include "platform/platform.h"

#include <openssl/evp.h>
#include <syslog.h>

#include <algorithm>
#include <limits>
#include <optional>
#include <string>

#include "platform/standin/domain_table.h"
#include "platform/standin/winbind.h"

// As utils/source_line.h, which the platform does not include.
#define SOURCE_LINE kSourceName, __LINE__

namespace {

using TAVO::Platform::AskWinbind;
using TAVO::Platform::FindInDomainTable;
using TAVO::Platform::WinbindAnswer;

constexpr char kSourceName[] = "platform";

constexpr std::size_t kLongestShown = 255;  // the longest DNS name

constexpr std::size_t kLongestInput = std::numeric_limits<int>::max() / 2;  // OpenSSL counts in int

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

/// Decodes base64. Accepts only the canonical text of the bytes.
bool DecodeBase64(const std::string &text, std::string &bytes) {
    if (text.size() % 4 != 0) {
        return false;
    }
    bytes.resize(3 * text.size() / 4);
    if (EVP_DecodeBlock(reinterpret_cast<unsigned char *>(bytes.data()),
                        reinterpret_cast<const unsigned char *>(text.data()), static_cast<int>(text.size())) < 0) {
        return false;
    }
    // EVP_DecodeBlock decodes padding to zero bytes and ignores blanks around the text.
    if (!text.empty()) {
        bytes.resize(bytes.size() - (text.back() == '=' ? 1 : 0) - (text[text.size() - 2] == '=' ? 1 : 0));
    }
    return EncodeBase64(bytes) == text;
}

/// Returns the domain for a log line, without control characters: the token's issuer chooses it.
std::string Shown(const std::string &domain) {
    std::string shown = domain.substr(0, kLongestShown);
    std::replace_if(
        shown.begin(), shown.end(), [](char c) { return static_cast<unsigned char>(c) < ' ' || c == '\x7f'; }, '?');
    return shown;
}

/// Finds the NetBIOS name in the administrator's table, then in the directory. Logs a failure.
std::optional<std::string> FindNetBIOSName(const std::string &domain) {
    if (std::optional<std::string> netBIOSName = FindInDomainTable(domain)) {
        return netBIOSName;
    }
    const WinbindAnswer answer = AskWinbind(domain);
    const std::string shown = Shown(domain);
    switch (answer.kind) {
        case WinbindAnswer::Kind::kKnown:
            return answer.text;
        case WinbindAnswer::Kind::kUnknown:
            syslog(LOG_ERR, "%s:%d domain '%s' is not in domains.conf, and winbindd does not know it", SOURCE_LINE,
                   shown.c_str());
            break;
        case WinbindAnswer::Kind::kNotAvailable:
            syslog(LOG_ERR, "%s:%d domain '%s' is not in domains.conf, and winbindd is not available", SOURCE_LINE,
                   shown.c_str());
            break;
        case WinbindAnswer::Kind::kSilent:
            syslog(LOG_ERR, "%s:%d domain '%s' is not in domains.conf, and winbindd does not answer", SOURCE_LINE,
                   shown.c_str());
            break;
        case WinbindAnswer::Kind::kNotAsked:
            syslog(LOG_ERR, "%s:%d domain '%s' is not in domains.conf, and winbindd cannot be asked: %s", SOURCE_LINE,
                   shown.c_str(), answer.text.c_str());
            break;
    }
    return std::nullopt;
}

/// Converts the domain in DOMAIN\user to its NetBIOS name. Logs a failure.
std::optional<std::string> ConvertDomain(const std::string &name) {
    const std::size_t backslash = name.find('\\');
    if (backslash == std::string::npos) {
        syslog(LOG_ERR, "%s:%d name without a domain", SOURCE_LINE);
        return std::nullopt;
    }
    const std::string domain = name.substr(0, backslash);
    if (backslash + 1 == name.size()) {
        syslog(LOG_ERR, "%s:%d name of domain '%s' without a user", SOURCE_LINE, Shown(domain).c_str());
        return std::nullopt;
    }
    const std::optional<std::string> netBIOSName = FindNetBIOSName(domain);
    return netBIOSName ? std::optional(*netBIOSName + name.substr(backslash)) : std::nullopt;
}

/// Copies a text and its NUL into a buffer for `usableSize` characters and the NUL.
bool CopyText(const std::string &text, char *dst, std::size_t usableSize) {
    if (text.size() > usableSize) {
        return false;
    }
    std::copy_n(text.c_str(), text.size() + 1, dst);
    return true;
}

}  // namespace

// These functions have C linkage and must not throw.

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
    if (src == nullptr || dst == nullptr) {
        syslog(LOG_ERR, "%s:%d no name, or no buffer for it", SOURCE_LINE);
        return -1;
    }
    const std::optional<std::string> converted = ConvertDomain(src);
    if (!converted) {
        return -1;
    }
    if (!CopyText(*converted, dst, size)) {
        syslog(LOG_ERR, "%s:%d name is too long for its buffer", SOURCE_LINE);
        return -1;
    }
    return 0;
} catch (const std::exception &) {
    syslog(LOG_ERR, "%s:%d memory ran out, or domains.conf is nested too deeply", SOURCE_LINE);
    return -1;
}
