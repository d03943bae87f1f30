#include "web/failure_lookup.h"

#include <algorithm>
#include <boost/algorithm/string/case_conv.hpp>
#include <boost/algorithm/string/predicate.hpp>
#include <boost/algorithm/string/replace.hpp>
#include <boost/algorithm/string/trim.hpp>
#include <cctype>
#include <iterator>
#include <locale>

namespace TAVO::Web {

namespace {

using Pieces = std::vector<std::string>;

bool IsPlaceholder(const std::string &word) {
    return std::find(std::begin(kPlaceholders), std::end(kPlaceholders), word) != std::end(kPlaceholders);
}

Pieces SplitAtPlaceholders(const std::string &ofTable) {
    if (ofTable == kErrorAnswer) {
        return {"{", "\"error\"", "}"};
    }
    Pieces pieces(1);
    std::string word;
    const auto endWord = [&] {
        if (IsPlaceholder(word)) {
            pieces.emplace_back();
        } else {
            pieces.back() += word;
        }
        word.clear();
    };
    for (const char c : ofTable) {
        if (std::isalnum(static_cast<unsigned char>(c)) != 0) {
            word += c;
        } else {
            endWord();
            pieces.back() += c;
        }
    }
    endWord();
    return pieces;
}

/// Returns whether `text` consists of the pieces in this order, with any text between them.
bool Consists(const std::string &text, const Pieces &pieces) {
    if (pieces.size() == 1) {
        return text == pieces.front();
    }
    if (!boost::starts_with(text, pieces.front())) {
        return false;
    }
    std::size_t end = pieces.front().size();
    for (std::size_t i = 1; i + 1 < pieces.size(); ++i) {
        const std::size_t found = text.find(pieces[i], end);
        if (found == std::string::npos) {
            return false;
        }
        end = found + pieces[i].size();
    }
    return boost::ends_with(text.substr(end), pieces.back());
}

/// Converts a text of libcurl 7 to that of libcurl 8.
std::string InWordsOfLibcurl8(std::string text) {
    boost::replace_all(text, "Couldn't", "Could not");
    boost::replace_all(text, "host name", "hostname");
    return text;
}

}  // namespace

bool IsText(const std::string &text, const char *ofTable) {
    // The library's JSON text ends in a line feed.
    return Consists(boost::trim_right_copy_if(text, boost::is_any_of("\n")), SplitAtPlaceholders(ofTable));
}

bool EndsInText(const std::string &line, const char *ofTable) {
    Pieces pieces = SplitAtPlaceholders(ofTable);
    pieces.insert(pieces.begin(), "");
    return Consists(boost::trim_right_copy(line), pieces);
}

bool EndsInTypedText(const std::string &line, const char *ofTable) {
    Pieces pieces = SplitAtPlaceholders(ofTable);
    pieces.insert(pieces.begin(), "");
    for (std::string &piece : pieces) {
        boost::to_lower(piece, std::locale::classic());
    }
    boost::trim_right_if(pieces.back(), boost::is_any_of("."));
    const std::string text = boost::trim_right_copy_if(line, boost::is_any_of(". \t\r\n"));
    return Consists(boost::to_lower_copy(text, std::locale::classic()), pieces);
}

std::size_t Specificity(const char *ofTable) {
    std::size_t characters = 0;
    for (const std::string &piece : SplitAtPlaceholders(ofTable)) {
        characters += piece.size();
    }
    return characters;
}

const FailureRow *FindTransfer(CURLcode result) {
    const std::vector<FailureRow> &rows = FailureTable();
    const auto row = std::find_if(rows.begin(), rows.end(), [&](const FailureRow &failure) {
        return failure.kind == FailureKind::kTransfer && failure.result == result;
    });
    return row != rows.end() ? &*row : nullptr;
}

CURLcode FindTransferText(const std::string &text) {
    const std::string words = InWordsOfLibcurl8(text);
    CURLcode found = CURLE_OK;
    std::size_t longest = 0;
    for (int code = CURLE_OK + 1; code < CURL_LAST; ++code) {
        const auto result = static_cast<CURLcode>(code);
        const std::string known = InWordsOfLibcurl8(curl_easy_strerror(result));
        if (known.size() > longest && known != "Unknown error" && boost::contains(words, known)) {
            found = result;
            longest = known.size();
        }
    }
    return found;
}

}  // namespace TAVO::Web
