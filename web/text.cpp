#include "web/text.h"

#include <sso/limits.h>

#include <algorithm>
#include <boost/locale/utf.hpp>
#include <memory>

namespace TAVO::Web {

namespace {

constexpr char kReplacementCharacter[] = "\xef\xbf\xbd";  // U+FFFD
constexpr std::size_t kLongestOrigin = 512;
static_assert(kLongestOrigin + sizeof R"({"csrf":"0123456789abcdef0123456789abcdef","origin":""})" <=
                  TAVO::SSO::kLongestState,
              "the longest origin and the random value must fit into the state");

using UTF8 = boost::locale::utf::utf_traits<char>;
using boost::locale::utf::code_point;

bool IsPrintable(code_point c) {
    const bool isControl = c < 0x20 || (c >= 0x7f && c < 0xa0);
    const bool isSeparator = c == 0x2028 || c == 0x2029;
    const bool isFormat = c == 0xad || c == 0x61c || c == 0x180e || (c >= 0x200b && c <= 0x200f) ||
                          (c >= 0x202a && c <= 0x202e) || (c >= 0x2060 && c <= 0x206f) || c == 0xfeff ||
                          (c >= 0xfff9 && c <= 0xfffb) || (c >= 0xe0000 && c <= 0xe007f);
    return boost::locale::utf::is_valid_codepoint(c) && !isControl && !isSeparator && !isFormat;
}

// Characters that neither browsers change in a path and query nor JSON in a string. Browsers read a backslash as a
// slash.
bool IsPathCharacter(char c) { return c > 0x20 && c < 0x7f && c != '\\' && c != '"'; }

/// Decodes the character at `at` and moves past it, or past one invalid byte.
code_point NextCharacter(std::string::const_iterator &at, std::string::const_iterator end) {
    const auto begin = at;
    const code_point character = UTF8::decode(at, end);
    if (!boost::locale::utf::is_valid_codepoint(character)) {
        at = begin + 1;
    }
    return character;
}

}  // namespace

std::string EscapeHtml(const std::string &text) {
    std::string escaped;
    for (const char c : text) {
        switch (c) {
            case '&':
                escaped += "&amp;";
                break;
            case '<':
                escaped += "&lt;";
                break;
            case '>':
                escaped += "&gt;";
                break;
            case '"':
                escaped += "&quot;";
                break;
            case '\'':
                escaped += "&#39;";
                break;
            default:
                escaped += c;
        }
    }
    return escaped;
}

bool IsPrintable(const std::string &text) {
    for (auto at = text.begin(); at != text.end();) {
        if (!IsPrintable(NextCharacter(at, text.end()))) {
            return false;
        }
    }
    return true;
}

std::string OneLine(const std::string &text, std::size_t longest) {
    std::string line;
    for (auto at = text.begin(); at != text.end();) {
        const auto begin = at;
        const code_point c = NextCharacter(at, text.end());
        const std::string character = IsPrintable(c)                              ? std::string(begin, at)
                                      : boost::locale::utf::is_valid_codepoint(c) ? " "
                                                                                  : kReplacementCharacter;
        if (line.size() + character.size() > longest) {
            break;
        }
        line += character;
    }
    line.erase(line.find_last_not_of(' ') + 1);
    return line;
}

std::string SafeOrigin(const std::string &origin, const std::string &startPage) {
    const bool isPath = !origin.empty() && origin[0] == '/' && origin.compare(0, 2, "//") != 0;
    const bool isSafe =
        isPath && origin.size() <= kLongestOrigin && std::all_of(origin.begin(), origin.end(), IsPathCharacter);
    return isSafe ? origin : startPage;
}

Json::Value ParseObject(const std::string &text) {
    Json::CharReaderBuilder strict;
    Json::CharReaderBuilder::strictMode(&strict.settings_);
    const std::unique_ptr<Json::CharReader> reader(strict.newCharReader());
    Json::Value value;
    std::string errors;
    try {
        if (reader->parse(text.data(), text.data() + text.size(), &value, &errors) && value.isObject()) {
            return value;
        }
    } catch (const Json::Exception &) {
        // Nested too deeply.
    }
    return {};
}

std::string StringMember(const Json::Value &object, const char *name) {
    return object.isObject() && object[name].isString() ? object[name].asString() : "";
}

std::string WriteCompact(const Json::Value &value) {
    Json::StreamWriterBuilder compact;
    compact["indentation"] = "";
    return Json::writeString(compact, value);
}

}  // namespace TAVO::Web
