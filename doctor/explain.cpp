#include "doctor/explain.h"

#include <boost/algorithm/string/classification.hpp>
#include <boost/algorithm/string/erase.hpp>
#include <boost/algorithm/string/predicate.hpp>
#include <boost/algorithm/string/trim.hpp>
#include <functional>
#include <iostream>

#include "doctor/provider_errors.h"
#include "web/failure.h"
#include "web/failure_lookup.h"

namespace Doctor {

namespace {

struct Column {
    const char *head;
    const char *TAVO::Web::FailureRow::*value;
};

struct Table {
    TAVO::Web::FailureKind kind;
    const char *title;
    const char *head;  // of the column with the texts
    std::vector<Column> columns;
};

const std::vector<Table> &Tables() {
    const Column level{"level", &TAVO::Web::FailureRow::type};
    const Column source{"source", &TAVO::Web::FailureRow::type};
    const Column type{"class", &TAVO::Web::FailureRow::type};
    const Column thrownBy{"thrown by", &TAVO::Web::FailureRow::thrownBy};
    const Column cause{"cause", &TAVO::Web::FailureRow::cause};
    const Column remedy{"remedy", &TAVO::Web::FailureRow::remedy};
    static const std::vector<Table> tables = {
        {TAVO::Web::FailureKind::kLibraryLine, "log lines of the library", "line", {level, cause, remedy}},
        {TAVO::Web::FailureKind::kPlatformLine, "log lines of the stand-in", "line", {level, cause, remedy}},
        {TAVO::Web::FailureKind::kFrontEndLine, "log lines of the front end", "line", {level, cause, remedy}},
        {TAVO::Web::FailureKind::kReason, "reasons of the front end", "reason", {cause, remedy}},
        {TAVO::Web::FailureKind::kException, "exceptions of the library", "text", {type, thrownBy, cause, remedy}},
        {TAVO::Web::FailureKind::kTransfer, "results of libcurl", "result", {cause, remedy}},
        {TAVO::Web::FailureKind::kProviderError, "error codes of the provider", "code", {cause, remedy, source}},
    };
    return tables;
}

const Table &TableOf(const TAVO::Web::FailureRow &failure) { return Tables()[static_cast<std::size_t>(failure.kind)]; }

const std::vector<TAVO::Web::FailureRow> &RowsWith(TAVO::Web::FailureKind kind) {
    return kind == TAVO::Web::FailureKind::kProviderError ? ProviderErrors() : TAVO::Web::FailureTable();
}

std::vector<std::reference_wrapper<const TAVO::Web::FailureRow>> RowsOf(const Table &table) {
    std::vector<std::reference_wrapper<const TAVO::Web::FailureRow>> rows;
    for (const TAVO::Web::FailureRow &failure : RowsWith(table.kind)) {
        if (failure.kind == table.kind) {
            rows.emplace_back(failure);
        }
    }
    return rows;
}

constexpr char kForeignText[] = "a text of another library";

std::vector<std::string> TextsOf(const TAVO::Web::FailureRow &failure) {
    return failure.texts.empty() ? std::vector<std::string>{kForeignText}
                                 : std::vector<std::string>(failure.texts.begin(), failure.texts.end());
}

void PrintMarkdown(const Table &table) {
    std::cout << "<!-- failures: " << table.title << " -->\n\n| " << table.head;
    std::string line = "| ---";
    for (const Column &column : table.columns) {
        std::cout << " | " << column.head;
        line += " | ---";
    }
    std::cout << " |\n" << line << " |\n";
    for (const TAVO::Web::FailureRow &failure : RowsOf(table)) {
        const char *separator = "| ";
        for (const std::string &text : TextsOf(failure)) {
            std::cout << separator << (text == kForeignText ? text : '`' + text + '`');
            separator = "<br>";
        }
        for (const Column &column : table.columns) {
            const std::string value = failure.*column.value;
            std::cout << " | "
                      << (column.value == &TAVO::Web::FailureRow::type &&
                                  table.kind == TAVO::Web::FailureKind::kException
                              ? '`' + value + '`'
                              : value);
        }
        std::cout << " |\n";
    }
    std::cout << "\n<!-- end -->\n";
}

/// Returns the most specific text of each kind that matches.
std::vector<Explanation> FindTexts(const std::string &text, bool (*matches)(const std::string &, const char *)) {
    std::vector<Explanation> found;
    for (const Table &table : Tables()) {
        Explanation best{nullptr, ""};
        for (const TAVO::Web::FailureRow &failure : RowsOf(table)) {
            for (const char *about : failure.texts) {
                // A text of placeholders only matches everything.
                if (TAVO::Web::Specificity(about) > TAVO::Web::Specificity(best.about.c_str()) &&
                    table.kind < TAVO::Web::FailureKind::kTransfer && matches(text, about)) {
                    best = {&failure, about};
                }
            }
        }
        if (best.failure != nullptr) {
            found.push_back(best);
        }
    }
    return found;
}

std::vector<Explanation> FindTransfer(const std::string &text) {
    const TAVO::Web::FailureRow *transfer = TAVO::Web::FindTransfer(TAVO::Web::FindTransferText(text));
    return transfer != nullptr ? std::vector<Explanation>{{transfer, transfer->texts.front()}}
                               : std::vector<Explanation>();
}

std::vector<Explanation> FindCodes(const std::string &text) {
    std::vector<Explanation> found;
    for (const TAVO::Web::FailureRow &error : ProviderErrors()) {
        if (ContainsCode(text, error.texts.front())) {
            found.push_back({&error, error.texts.front()});
        }
    }
    return found;
}

/// Returns the failures for which the relay page shows this sentence.
std::vector<Explanation> FindSentence(const std::string &text) {
    const std::string sentence = boost::trim_right_copy_if(text, boost::is_any_of(". \n"));
    std::vector<Explanation> found;
    for (const TAVO::Web::FailureRow &failure : TAVO::Web::FailureTable()) {
        const bool isShown =
            failure.kind == TAVO::Web::FailureKind::kReason || failure.kind == TAVO::Web::FailureKind::kException;
        if (isShown && boost::iequals(sentence + '.', TAVO::Web::SentenceOf(failure.code))) {
            found.push_back({&failure, TextsOf(failure).front()});
        }
    }
    return found;
}

/// Returns the failures whose text, or a result of libcurl or an error code in it, is in `text`.
std::vector<Explanation> FindFailures(const std::string &text) {
    std::vector<Explanation> found = FindTexts(text, TAVO::Web::EndsInText);
    if (found.empty()) {
        found = FindTexts(text, TAVO::Web::EndsInTypedText);
    }
    for (const std::vector<Explanation> &more : {FindTransfer(text), FindCodes(text)}) {
        found.insert(found.end(), more.begin(), more.end());
    }
    return found;
}

}  // namespace

std::vector<Explanation> LookUp(const std::string &text) {
    std::vector<Explanation> found = FindFailures(text);
    if (found.empty()) {
        const std::string reason = ReasonOfSentence(text);
        found = reason.empty() ? FindSentence(text) : FindFailures(reason);
    }
    return found;
}

std::vector<Explanation> AllExplanations() {
    std::vector<Explanation> all;
    for (const Table &table : Tables()) {
        for (const TAVO::Web::FailureRow &failure : RowsOf(table)) {
            for (const std::string &text : TextsOf(failure)) {
                all.push_back({&failure, text});
            }
        }
    }
    return all;
}

std::string WithoutBackticks(const std::string &text) { return boost::erase_all_copy(text, "`"); }

void PrintExplanations(const std::vector<Explanation> &explanations) {
    for (const Explanation &explanation : explanations) {
        std::cout << explanation.about << '\n';
        for (const Column &column : TableOf(*explanation.failure).columns) {
            std::cout << "  " << column.head << ": " << WithoutBackticks(explanation.failure->*column.value) << '\n';
        }
    }
}

Json::Value ExplanationsAsJson(const std::vector<Explanation> &explanations) {
    Json::Value json = Json::arrayValue;
    for (const Explanation &explanation : explanations) {
        const Table &table = TableOf(*explanation.failure);
        Json::Value one;
        one["about"] = explanation.about;
        one["table"] = table.title;
        for (const Column &column : table.columns) {
            one[column.head] = WithoutBackticks(explanation.failure->*column.value);
        }
        one["sentence"] = TAVO::Web::SentenceOf(explanation.failure->code);
        json.append(one);
    }
    return json;
}

void PrintMarkdown() {
    for (const Table &table : Tables()) {
        PrintMarkdown(table);
    }
}

}  // namespace Doctor
