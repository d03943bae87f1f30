#include "doctor/book.h"

#include <fnmatch.h>

#include <algorithm>
#include <array>
#include <boost/algorithm/string.hpp>
#include <cctype>
#include <cstring>
#include <sstream>

#include "doctor/built_in.h"
#include "web/text.h"

namespace Doctor {

namespace {

/// A kind of table, by what its first column is headed with.
struct Kind {
    const char *head;
    std::array<const char *, 8> placeholders;  // words of its texts that stand for something else
};

constexpr Kind kKinds[] = {
    {"line", {"N", "CURL", "SYSTEM", "NAME", "ID", "SOURCE", "REASON", "DOMAIN"}},
    {"reason", {"SYSTEM", "ERROR", "DESCRIPTION"}},
    {"text", {"ALG"}},
    {"CURL", {}},
};

constexpr char kErrorAnswer[] = "the provider's answer as JSON (Azure alone)";

struct Row {
    const Kind *kind;
    std::string pattern;  // for fnmatch
    Explanation explanation;
};

std::vector<std::string> SplitAt(const std::string &text, const char *separator) {
    std::vector<std::string> pieces;
    return boost::iter_split(pieces, text, boost::first_finder(separator));
}

/// Without the marks that a terminal does not show.
std::string Plain(const std::string &markdown) {
    std::string plain;
    for (std::size_t i = 0; i < markdown.size(); ++i) {
        const bool isLinkEnd = markdown.compare(i, 2, "](") == 0;
        if (isLinkEnd) {
            i = std::min(markdown.find(')', i), markdown.size());
        } else if (markdown[i] != '`' && markdown[i] != '[' && markdown.compare(i, 2, "**") != 0 &&
                   (i == 0 || markdown.compare(i - 1, 2, "**") != 0)) {
            plain += markdown[i];
        }
    }
    return plain;
}

/// The texts that a row is about: those marked as code or, where none is, the lines of the cell.
std::vector<std::string> TextsOf(const std::string &cell) {
    const std::vector<std::string> pieces = SplitAt(cell, "`");
    if (pieces.size() < 3) {
        return SplitAt(cell, "<br>");
    }
    std::vector<std::string> texts;
    for (std::size_t i = 1; i < pieces.size(); i += 2) {
        texts.push_back(pieces[i]);
    }
    return texts;
}

std::string PatternOf(const std::string &text, const Kind &kind) {
    std::string pattern = "*";  // what the log, or a line of the front end, puts before it
    std::string word;
    const auto endWord = [&] {
        const auto &names = kind.placeholders;
        const bool isPlaceholder =
            std::any_of(names.begin(), names.end(), [&](const char *name) { return name != nullptr && word == name; });
        pattern += isPlaceholder ? "*" : word;
        word.clear();
    };
    for (const char c : text) {
        if (std::isalnum(static_cast<unsigned char>(c)) != 0) {
            word += c;
            continue;
        }
        endWord();
        if (std::strchr("*?[]\\", c) != nullptr) {
            pattern += '\\';
        }
        pattern += c;
    }
    endWord();
    return pattern;
}

const Kind *KindOf(const std::string &head) {
    const auto *kind =
        std::find_if(std::begin(kKinds), std::end(kKinds), [&](const Kind &other) { return head == other.head; });
    return kind != std::end(kKinds) ? kind : nullptr;
}

std::vector<std::string> SplitRow(const std::string &line) {
    constexpr std::size_t kBar = 2;  // with its blank
    return SplitAt(line.substr(kBar, line.size() - 2 * kBar), " | ");
}

void ReadRows(const char *guide, std::vector<Row> &rows) {
    std::istringstream lines(guide);
    std::vector<std::string> heads;
    const Kind *kind = nullptr;
    for (std::string line; std::getline(lines, line);) {
        if (!boost::starts_with(line, "| ") || !boost::ends_with(line, " |")) {
            heads.clear();
            continue;
        }
        const std::vector<std::string> cells = SplitRow(line);
        if (heads.empty()) {
            heads = cells;
            kind = KindOf(heads.front());
        } else if (kind != nullptr && cells.size() == heads.size() && !boost::starts_with(line, "| ---")) {
            Explanation explanation;
            for (std::size_t i = 1; i < cells.size(); ++i) {
                explanation.told.emplace_back(heads[i], Plain(cells[i]));
            }
            for (const std::string &text : TextsOf(cells.front())) {
                explanation.about = text;
                // A provider need not describe its error, and the word before that takes whatever comes.
                rows.push_back({kind, PatternOf(boost::erase_last_copy(text, " (DESCRIPTION)"), *kind), explanation});
            }
        }
    }
}

const std::vector<Row> &Rows() {
    static const std::vector<Row> rows = [] {
        std::vector<Row> all;
        ReadRows(kOperationsGuide, all);
        ReadRows(kIntegrationGuide, all);
        return all;
    }();
    return rows;
}

bool IsErrorAnswer(const std::string &text) {
    const Json::Value answer = TAVO::Web::ParseObject(text);
    return answer.isObject() && answer.isMember("error");
}

bool IsAbout(const Row &row, const std::string &text) {
    return row.explanation.about == kErrorAnswer ? IsErrorAnswer(text)
                                                 : fnmatch(row.pattern.c_str(), text.c_str(), 0) == 0;
}

/// The more of a pattern is letters and not whatever may stand there, the more it says.
std::size_t Weight(const Row &row) {
    return row.pattern.size() - static_cast<std::size_t>(std::count(row.pattern.begin(), row.pattern.end(), '*'));
}

}  // namespace

std::string Explanation::Told(const std::string &column) const {
    for (const auto &[head, text] : told) {
        if (head == column) {
            return text;
        }
    }
    return {};
}

std::vector<Explanation> LookUp(const std::string &text) {
    const std::string line = boost::trim_copy(text);
    std::vector<Explanation> found;
    for (const Kind &kind : kKinds) {
        const Row *best = nullptr;
        for (const Row &row : Rows()) {
            if (row.kind == &kind && IsAbout(row, line) && (best == nullptr || Weight(row) > Weight(*best))) {
                best = &row;
            }
        }
        if (best != nullptr) {
            found.push_back(best->explanation);
        }
    }
    return found;
}

std::string CauseOf(const std::string &curlText) {
    for (const Row &row : Rows()) {
        if (row.explanation.about == curlText) {
            return row.explanation.Told("cause");
        }
    }
    return {};
}

}  // namespace Doctor
