#include "platform/check/base64_reference.h"

namespace PlatformCheck {

std::string Base64(const std::string &bytes) {
    std::string text;
    for (std::size_t i = 0; i < bytes.size(); i += 3) {
        std::string group = bytes.substr(i, 3);
        const std::size_t padding = 3 - group.size();
        group.resize(3, '\0');
        unsigned int bits = 0;
        for (const char byte : group) {
            bits = bits << 8 | static_cast<unsigned char>(byte);
        }
        const std::string characters = {kBase64Alphabet[bits >> 18], kBase64Alphabet[bits >> 12 & 63],
                                        kBase64Alphabet[bits >> 6 & 63], kBase64Alphabet[bits & 63]};
        text += characters.substr(0, 4 - padding) + std::string(padding, '=');
    }
    return text;
}

std::vector<std::string> ShortInputs() {
    std::vector<std::string> inputs;
    for (std::size_t size = 0; size <= 48; ++size) {
        inputs.push_back(LongInput(size));
    }
    for (int byte = 0; byte < 256; ++byte) {
        for (std::size_t position = 0; position < 3; ++position) {
            inputs.push_back(std::string(position, 'x') + static_cast<char>(byte));
        }
    }
    return inputs;
}

std::string LongInput(std::size_t size) {
    std::string input;
    for (std::size_t i = 0; i < size; ++i) {
        input += static_cast<char>(i * 7 + 1);  // 7 and 256 have no common divisor
    }
    return input;
}

}  // namespace PlatformCheck
