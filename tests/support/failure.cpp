#include "tests/support/failure.h"

#include <cxxabi.h>

#include <algorithm>
#include <cstdlib>
#include <memory>
#include <ostream>
#include <stdexcept>

#include "web/failure_lookup.h"

namespace Test {

namespace {

/// The class without the library's namespaces and Boost's wrapper, as in the table.
std::string NameInTable(std::string name) {
    for (const std::string around : {"TAVO::SSO::", "TAVO::JWT::", "boost::wrapexcept<"}) {
        if (name.compare(0, around.size(), around) == 0) {
            name.erase(0, around.size());
        }
    }
    return name.substr(0, name.find('>'));
}

bool IsText(const std::string &type, const std::string &text, const char *ofTable) {
    // The text begins with "alg" of the token and ends at a NUL in it.
    const bool isCut = type == "jwt_not_support" && text.find(' ') == std::string::npos;
    return std::string(ofTable) == "CURL" ? TAVO::Web::FindTransferText(text) != CURLE_OK
                                          : isCut || TAVO::Web::IsText(text, ofTable);
}

bool IsInTable(const std::string &type, const std::string &text) {
    const bool isOfFrontEnd = type == "TAVO::Web::Refusal" || type == "std::system_error";
    const TAVO::Web::FailureKind kind =
        isOfFrontEnd ? TAVO::Web::FailureKind::kReason : TAVO::Web::FailureKind::kException;
    const std::vector<TAVO::Web::FailureRow> &rows = TAVO::Web::FailureTable();
    return std::any_of(rows.begin(), rows.end(), [&](const TAVO::Web::FailureRow &row) {
        return row.kind == kind && (isOfFrontEnd || type == row.type) &&
               (row.texts.empty() || std::any_of(row.texts.begin(), row.texts.end(),
                                                 [&](const char *ofTable) { return IsText(type, text, ofTable); }));
    });
}

}  // namespace

bool operator==(const Failure &a, const Failure &b) { return a.type == b.type && a.text == b.text; }

std::ostream &operator<<(std::ostream &stream, const Failure &failure) {
    return stream << failure.type << " \"" << failure.text << "\"";
}

std::string ClassOf(const std::exception &error) {
    const std::unique_ptr<char, decltype(&std::free)> name(
        abi::__cxa_demangle(typeid(error).name(), nullptr, nullptr, nullptr), std::free);
    return name.get();
}

void RequireInTable(const std::exception &error) {
    const std::string type = ClassOf(error);
    if (!IsInTable(NameInTable(type), error.what())) {
        throw std::logic_error("web/failure_table.cpp has no row for " + type + ": " + error.what());
    }
}

}  // namespace Test
