#include "tests/support/encoding.h"

#include <openssl/evp.h>

namespace Test {

std::string Base64(const std::string &bytes) {
    std::string text(4 * ((bytes.size() + 2) / 3), '\0');
    EVP_EncodeBlock(reinterpret_cast<unsigned char *>(text.data()),
                    reinterpret_cast<const unsigned char *>(bytes.data()), static_cast<int>(bytes.size()));
    return text;
}

std::string Base64Url(const std::string &bytes) {
    std::string text = Base64(bytes);
    text.resize(text.find_last_not_of('=') + 1);
    for (char &c : text) {
        c = c == '+' ? '-' : c == '/' ? '_' : c;
    }
    return text;
}

std::string FromBase64(const std::string &text) {
    std::string bytes(text.size(), '\0');
    const int length =
        EVP_DecodeBlock(reinterpret_cast<unsigned char *>(bytes.data()),
                        reinterpret_cast<const unsigned char *>(text.data()), static_cast<int>(text.size()));
    bytes.resize(length < 0 ? 0 : static_cast<std::size_t>(length));
    for (auto end = text.rbegin(); end != text.rend() && *end == '=' && !bytes.empty(); ++end) {
        bytes.pop_back();  // EVP_DecodeBlock decodes padding to a zero byte
    }
    return bytes;
}

std::string PercentDecode(const std::string &text) {
    std::string decoded;
    for (std::size_t i = 0; i < text.size(); ++i) {
        if (text[i] == '%') {
            decoded += static_cast<char>(std::stoi(text.substr(i + 1, 2), nullptr, 16));
            i += 2;
        } else {
            decoded += text[i];
        }
    }
    return decoded;
}

}  // namespace Test
