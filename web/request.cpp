#include "web/request.h"

#include <utility>
#include <vector>

namespace TAVO::Web {

namespace {

std::vector<std::string> Split(const std::string &text, char separator) {
    std::vector<std::string> pieces;
    std::size_t begin = 0;
    for (std::size_t end; (end = text.find(separator, begin)) != std::string::npos; begin = end + 1) {
        pieces.push_back(text.substr(begin, end - begin));
    }
    pieces.push_back(text.substr(begin));
    return pieces;
}

std::pair<std::string, std::string> SplitAtEqualsSign(const std::string &text) {
    const std::size_t sign = text.find('=');
    return sign == std::string::npos ? std::pair(text, std::string())
                                     : std::pair(text.substr(0, sign), text.substr(sign + 1));
}

int HexDigit(char digit) {
    if (digit >= '0' && digit <= '9') {
        return digit - '0';
    }
    if (digit >= 'A' && digit <= 'F') {
        return digit - 'A' + 10;
    }
    return digit >= 'a' && digit <= 'f' ? digit - 'a' + 10 : -1;
}

std::string DecodePercent(const std::string &text) {
    std::string decoded;
    for (std::size_t i = 0; i < text.size(); ++i) {
        const int high = text[i] == '%' && i + 2 < text.size() ? HexDigit(text[i + 1]) : -1;
        const int low = high >= 0 ? HexDigit(text[i + 2]) : -1;
        if (low >= 0) {
            decoded += static_cast<char>(high * 16 + low);
            i += 2;
        } else {
            decoded += text[i] == '+' ? ' ' : text[i];
        }
    }
    return decoded;
}

}  // namespace

Parameters ParseQuery(const std::string &query) {
    Parameters parameters;
    for (const std::string &piece : Split(query, '&')) {
        if (!piece.empty()) {
            const auto [name, value] = SplitAtEqualsSign(piece);
            parameters.emplace(DecodePercent(name), DecodePercent(value));
        }
    }
    return parameters;
}

std::optional<std::string> OnlyValue(const Parameters &parameters, const std::string &name) {
    return parameters.count(name) == 1 ? std::optional(parameters.find(name)->second) : std::nullopt;
}

}  // namespace TAVO::Web
