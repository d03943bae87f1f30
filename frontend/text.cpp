#include "frontend/text.h"

#include <algorithm>
#include <memory>

namespace Frontend {

namespace {

constexpr char kStartPage[] = "/index.cgi";
// With the random value beside it, the longest origin must fit into the state: 721 bytes of compact JSON.
constexpr std::size_t kLongestOrigin = 512;

bool IsControl(char c) { return static_cast<unsigned char>(c) < 0x20 || c == 0x7f; }

/// Of UTF-8: a byte within a character, not its first.
bool ContinuesCharacter(char c) { return (static_cast<unsigned char>(c) & 0xc0) == 0x80; }

// What a browser leaves as it is in a path and its query, and JSON in a string. A backslash would be a slash to it.
bool IsPathCharacter(char c) { return c > 0x20 && c < 0x7f && c != '\\' && c != '"'; }

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

bool HasControlCharacter(const std::string &text) { return std::any_of(text.begin(), text.end(), IsControl); }

std::string OneLine(std::string text, std::size_t longest) {
    if (text.size() > longest) {
        std::size_t end = longest;
        // No character has more than three bytes after its first.
        while (end > longest - 3 && ContinuesCharacter(text[end])) {
            --end;
        }
        text.resize(end);
    }
    std::replace_if(text.begin(), text.end(), IsControl, ' ');
    text.erase(text.find_last_not_of(' ') + 1);
    return text;
}

std::string SafeOrigin(const std::string &origin) {
    const bool isPath = !origin.empty() && origin[0] == '/' && origin.compare(0, 2, "//") != 0;
    const bool isSafe =
        isPath && origin.size() <= kLongestOrigin && std::all_of(origin.begin(), origin.end(), IsPathCharacter);
    return isSafe ? origin : kStartPage;
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
        // Too deeply nested: no object that anyone here has written.
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

}  // namespace Frontend
