#include "utils/split.h"

#include <boost/algorithm/string/classification.hpp>
#include <boost/algorithm/string/split.hpp>

namespace TAVO::Utils {

namespace {

/// Counts up to `most`.
std::size_t Count(char separator, const std::string &text, std::size_t most) {
    std::size_t count = 0;
    for (std::size_t at = text.find(separator); at != std::string::npos && count < most;
         at = text.find(separator, at + 1)) {
        ++count;
    }
    return count;
}

}  // namespace

std::vector<std::string> SplitInto(std::size_t pieces, const std::string &text, char separator) {
    std::vector<std::string> result;
    // Count first: splitting 30 MB of separators would take gigabytes.
    if (Count(separator, text, pieces) == pieces - 1) {
        boost::split(result, text, boost::is_any_of(std::string(1, separator)));
    }
    return result;
}

}  // namespace TAVO::Utils
