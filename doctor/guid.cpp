#include "doctor/guid.h"

#include <regex>

namespace Doctor {

namespace {

constexpr std::size_t kLongestSearched = 2048;  // std::regex recurses once per character

const std::regex &Pattern() {
    static const std::regex pattern("[0-9a-fA-F]{8}(-[0-9a-fA-F]{4}){3}-[0-9a-fA-F]{12}");
    return pattern;
}

}  // namespace

bool IsGUID(const std::string &text) { return text.size() <= kLongestSearched && std::regex_match(text, Pattern()); }

std::string FindGUID(const std::string &text) {
    const std::string searched = text.substr(0, kLongestSearched);
    std::smatch found;
    return std::regex_search(searched, found, Pattern()) ? found.str() : "";
}

}  // namespace Doctor
