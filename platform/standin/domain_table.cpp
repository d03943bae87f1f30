#include "platform/standin/domain_table.h"

#include <json/json.h>

#include <boost/algorithm/string/predicate.hpp>
#include <cerrno>
#include <fstream>
#include <iterator>
#include <locale>
#include <memory>
#include <new>

namespace TAVO::Platform {

namespace {

/// Returns null if the file is missing or not JSON. Throws if memory runs out: the table overrides the directory, so it
/// must not count as missing.
Json::Value ReadTable() {
    try {
        std::ifstream file(kDomainTable);
        if (!file && errno == ENOMEM) {
            throw std::bad_alloc();
        }
        const std::string text{std::istreambuf_iterator<char>(file), {}};
        return ParseDomainTable(text, nullptr);
    } catch (const std::ios_base::failure &) {
        // The path is a directory.
    }
    return {};
}

}  // namespace

Json::Value ParseDomainTable(const std::string &text, std::string *errors) {
    Json::Value table;
    const std::unique_ptr<Json::CharReader> reader(Json::CharReaderBuilder().newCharReader());
    return reader->parse(text.data(), text.data() + text.size(), &table, errors) ? table : Json::Value();
}

std::optional<std::string> FindInDomainTable(const std::string &domain) {
    const Json::Value table = ReadTable();
    if (!table.isObject()) {
        return std::nullopt;
    }
    for (const std::string &name : table.getMemberNames()) {
        const Json::Value &netBIOSName = table[name];
        if (boost::iequals(name, domain, std::locale::classic()) && netBIOSName.isString() &&
            !netBIOSName.asString().empty()) {
            return netBIOSName.asString();
        }
    }
    return std::nullopt;
}

}  // namespace TAVO::Platform
