#include "utils/split.h"

#include <algorithm>
#include <boost/algorithm/string/classification.hpp>
#include <boost/algorithm/string/split.hpp>

namespace TAVO::Utils {

std::vector<std::string> SplitInto(std::size_t pieces, const std::string &text, char separator) {
    std::vector<std::string> result;
    // Counted first: the pieces of 30 MB of separators would take gigabytes.
    const auto separators = static_cast<std::size_t>(std::count(text.begin(), text.end(), separator));
    if (separators + 1 == pieces) {
        boost::split(result, text, boost::is_any_of(std::string(1, separator)));
    }
    return result;
}

}  // namespace TAVO::Utils
