#include "utils/cleanse.h"

#include <algorithm>

namespace TAVO::Utils {

void AppendSecret(std::string &text, const char *bytes, std::size_t length) {
    const std::size_t needed = text.size() + length;
    if (needed > text.capacity()) {
        std::string roomier;
        roomier.reserve(std::max(needed, 2 * text.capacity()));
        roomier = text;
        const CleanseTextOnExit cleanse(roomier);  // the old text, after the swap
        text.swap(roomier);
    }
    text.append(bytes, length);
}

}  // namespace TAVO::Utils
