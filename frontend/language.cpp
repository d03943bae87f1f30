#include "frontend/language.h"

#include <algorithm>
#include <boost/algorithm/string.hpp>
#include <charconv>
#include <vector>

#include "frontend/catalogues.h"

namespace Frontend {

namespace {

struct Preference {
    std::string language;
    double weight;
};

/// Reads "de-AT;q=0.8". Regions and scripts are ignored: there is one catalogue for each language.
Preference ReadPreference(const std::string &item) {
    const std::size_t parameter = item.find(';');
    std::string language = boost::trim_copy(item.substr(0, item.find_first_of(";-")));
    boost::to_lower(language, std::locale::classic());
    if (parameter == std::string::npos) {
        return {language, 1};
    }
    const std::string weight = boost::trim_copy(item.substr(parameter + 1));
    double value = 0;
    if (boost::istarts_with(weight, "q=")) {
        std::from_chars(weight.data() + 2, weight.data() + weight.size(), value);
    }
    return {language, value};
}

}  // namespace

std::string PreferredLanguage(const std::string &acceptLanguage) {
    std::vector<std::string> items;
    boost::split(items, acceptLanguage, boost::is_any_of(","));
    std::string preferred = "en";
    double most = 0;
    for (const std::string &item : items) {
        const Preference preference = ReadPreference(item);
        if (preference.weight > most && preference.weight <= 1 && FindCatalogue(preference.language) != nullptr) {
            preferred = preference.language;
            most = preference.weight;
        }
    }
    return preferred;
}

}  // namespace Frontend
