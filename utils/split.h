#ifndef TAVOSSO_UTILS_SPLIT_H
#define TAVOSSO_UTILS_SPLIT_H

#include <cstddef>
#include <string>
#include <vector>

namespace TAVO::Utils {

/// Splits a text at each separator, without merging adjacent ones. Returns no pieces unless there are exactly `pieces`.
std::vector<std::string> SplitInto(std::size_t pieces, const std::string &text, char separator);

}  // namespace TAVO::Utils

#endif
