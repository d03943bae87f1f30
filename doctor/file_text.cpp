#include "doctor/file_text.h"

#include <json/json.h>

#include <algorithm>
#include <boost/algorithm/string/predicate.hpp>
#include <boost/algorithm/string/trim.hpp>
#include <boost/locale/utf.hpp>
#include <memory>
#include <regex>

namespace Doctor {

namespace {

constexpr char kByteOrderMark[] = "\xef\xbb\xbf";
constexpr char kSaveAsUTF8[] = "Save the file as UTF-8 without a byte-order mark.";

struct NamedCharacter {
    const char *bytes;
    const char *name;
};

constexpr NamedCharacter kPasted[] = {
    {"\xe2\x80\x9c", "smart quote"},
    {"\xe2\x80\x9d", "smart quote"},
    {"\xe2\x80\x9e", "smart quote"},
    {"\xe2\x80\x98", "smart quote"},
    {"\xe2\x80\x99", "smart quote"},
    {"\xc2\xab", "quotation mark of another language"},
    {"\xc2\xbb", "quotation mark of another language"},
    {"\xc2\xa0", "no-break space"},
    {"\xe2\x80\xaf", "no-break space"},
};

const NamedCharacter *PastedAt(const std::string &text, std::size_t offset) {
    const auto *found = std::find_if(std::begin(kPasted), std::end(kPasted), [&](const NamedCharacter &character) {
        return text.compare(offset, std::char_traits<char>::length(character.bytes), character.bytes) == 0;
    });
    return found != std::end(kPasted) ? found : nullptr;
}

/// Returns the end of a string or comment that begins at `offset`, or `offset`.
std::size_t SkipOpaque(const std::string &text, std::size_t offset) {
    const auto endAfter = [&](const char *end, std::size_t from) {
        const std::size_t found = text.find(end, from);
        return found == std::string::npos ? text.size() : found + std::char_traits<char>::length(end);
    };
    if (text.compare(offset, 2, "//") == 0) {
        return endAfter("\n", offset);
    }
    if (text.compare(offset, 2, "/*") == 0) {
        return endAfter("*/", offset + 2);
    }
    if (text[offset] != '"') {
        return offset;
    }
    for (++offset; offset < text.size() && text[offset] != '"'; ++offset) {
        offset += text[offset] == '\\' ? 1 : 0;
    }
    return std::min(offset + 1, text.size());
}

bool IsTrailingComma(const std::string &text, std::size_t offset) {
    const std::size_t next = text[offset] == ',' ? text.find_first_not_of(" \t\r\n", offset + 1) : std::string::npos;
    return next != std::string::npos && (text[next] == '}' || text[next] == ']');
}

}  // namespace

std::string PositionOf(const std::string &text, std::size_t offset) {
    const std::string before = text.substr(0, offset);
    const std::size_t lineBegin = before.rfind('\n') == std::string::npos ? 0 : before.rfind('\n') + 1;
    const auto column = std::count_if(before.begin() + static_cast<std::ptrdiff_t>(lineBegin), before.end(),
                                      [](char c) { return (static_cast<unsigned char>(c) & 0xc0) != 0x80; });
    return "line " + std::to_string(1 + std::count(before.begin(), before.end(), '\n')) + ", column " +
           std::to_string(1 + column);
}

TextProblem FindMistake(const std::string &text) {
    if (boost::trim_copy(text).empty()) {
        return {"is empty", "Write the file, or restore it from a backup."};
    }
    if (boost::starts_with(text, kByteOrderMark)) {
        return {"begins with a byte-order mark, at line 1, column 1", kSaveAsUTF8};
    }
    if (text.find('\0') != std::string::npos) {
        return {"is UTF-16 or binary, from line 1, column 1", kSaveAsUTF8};
    }
    for (std::size_t offset = 0; offset < text.size(); ++offset) {
        const std::size_t end = SkipOpaque(text, offset);
        if (end != offset) {
            offset = end - 1;
            continue;
        }
        const std::string position = "is not JSON: " + PositionOf(text, offset);
        if (const NamedCharacter *character = PastedAt(text, offset)) {
            const bool isSpace = boost::contains(character->name, "space");
            return {position + ": " + character->name + " outside a string",
                    isSpace ? "Replace it by an ordinary blank." : R"(Replace it by an ordinary quotation mark (").)"};
        }
        if (text[offset] == '\'') {
            return {position + ": single quote", R"(Replace it by a double quotation mark (").)"};
        }
        if (IsTrailingComma(text, offset)) {
            return {position + ": comma after the last member", "Remove the comma."};
        }
    }
    return {};
}

TextProblem FindInvalidByte(const std::string &text) {
    using UTF8 = boost::locale::utf::utf_traits<char>;
    for (auto at = text.begin(); at != text.end();) {
        const auto begin = at;
        if (!boost::locale::utf::is_valid_codepoint(UTF8::decode(at, text.end()))) {
            return {PositionOf(text, static_cast<std::size_t>(begin - text.begin())) + ": a byte that is not UTF-8",
                    kSaveAsUTF8};
        }
    }
    return {};
}

TextProblem FindDuplicateKey(const std::string &text) {
    Json::CharReaderBuilder builder;
    builder["rejectDupKeys"] = true;
    const std::unique_ptr<Json::CharReader> reader(builder.newCharReader());
    Json::Value ignored;
    std::string errors;
    try {
        reader->parse(text.data(), text.data() + text.size(), &ignored, &errors);
    } catch (const Json::Exception &) {
        return {};  // nested too deeply, which the library's reader reports
    }
    static const std::regex pattern("Line ([0-9]+), Column ([0-9]+)\\s+Duplicate key: '([A-Za-z_.-]{1,64})'");
    std::smatch found;
    if (!std::regex_search(errors, found, pattern)) {
        return {};
    }
    return {"line " + found.str(1) + ": the key \"" + found.str(3) + "\" occurs twice; the last value counts",
            "Remove one of the lines."};
}

std::string FindPastedCharacter(const std::string &value) {
    for (std::size_t offset = 0; offset < value.size(); ++offset) {
        if (const NamedCharacter *character = PastedAt(value, offset)) {
            return character->name;
        }
    }
    return {};
}

}  // namespace Doctor
