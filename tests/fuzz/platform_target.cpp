// The platform's stand-in. Input lines: "url", "encode", "decode" or "netbios", the size argument, and the text. An
// input is accepted if the function succeeds.
#include <algorithm>
#include <cstdlib>
#include <vector>

#include "platform/platform.h"
#include "tests/fuzz/domains.h"
#include "tests/fuzz/oracle.h"
#include "tests/fuzz/target.h"

namespace Fuzz {

namespace {

constexpr std::size_t kLargest = 8192;
constexpr char kMark = '#';

/// A marked buffer of exactly `size` bytes, so AddressSanitizer detects writes beyond it.
class Buffer {
  public:
    explicit Buffer(std::size_t size) : bytes_(size, kMark) {}

    char *data() { return bytes_.data(); }

    /// Requires `content` at the beginning and marks after it.
    void Require(const std::optional<std::string> &content) const {
        std::vector<char> expected(bytes_.size(), kMark);
        if (content) {
            std::copy(content->begin(), content->end(), expected.begin());
        }
        Fuzz::Require(bytes_ == expected, "unexpected content of the buffer");
    }

  private:
    std::vector<char> bytes_;
};

/// The result with its NUL, if it fits.
std::optional<std::string> AsText(const std::optional<std::string> &result, std::size_t longest) {
    return result && result->size() <= longest ? std::optional(*result + '\0') : std::nullopt;
}

bool EncodesURL(const std::string &text, std::size_t size) {
    Buffer buffer(size + 1);
    const int result = TavoCgiURLEncode(text.c_str(), buffer.data(), size);
    const std::optional<std::string> expected = AsText(PercentEncode(text), size);
    Require((result == 0) == expected.has_value(), "unexpected result of percent-encoding");
    buffer.Require(expected);
    return result == 0;
}

bool Encodes(const std::string &text, std::size_t size) {
    Buffer buffer(size);
    const int result = TLIBCBase64SzEncodeFull(text.data(), text.size(), buffer.data(), 1, size, 0, 1);
    const std::optional<std::string> expected = size == 0 ? std::nullopt : AsText(EncodeBase64(text), size - 1);
    Require((result != 0) == expected.has_value(), "unexpected result of encoding");
    buffer.Require(expected);
    return result != 0;
}

bool Decodes(const std::string &text, std::size_t size) {
    Buffer buffer(size);
    std::size_t length = size;
    const int result = TLIBCBase64Decode(text.data(), text.size(), buffer.data(), &length);
    std::optional<std::string> expected = DecodeCanonicalBase64(text);
    // An empty vector has a null address, which the function rejects.
    if (expected && (expected->size() > size || size == 0)) {
        expected.reset();
    }
    Require((result != 0) == expected.has_value(), "unexpected result of decoding");
    Require(length == (expected ? expected->size() : size), "unexpected length");
    buffer.Require(expected);
    return result != 0;
}

bool Converts(const std::string &name, std::size_t size) {
    WriteDomainTable();
    Buffer buffer(size + 1);
    const int result = TAVOWinsUserNameFqdn2Netbios(name.c_str(), buffer.data(), size);
    const Conversion conversion = ToNetBIOS(name, size);
    const std::optional<std::string> expected = AsText(conversion.name, size);
    Require((result >= 0) == expected.has_value(), "unexpected result of the conversion");
    buffer.Require(expected);
    RequireLog(Lines(conversion));
    return result >= 0;
}

}  // namespace

bool Accepts(const std::string &input) {
    const std::vector<std::string> lines = Lines(input, 3);
    const std::size_t size = std::min<std::size_t>(std::strtoul(lines[1].c_str(), nullptr, 10), kLargest);
    if (lines[0] == "url") {
        return EncodesURL(lines[2], size);
    }
    if (lines[0] == "encode") {
        return Encodes(lines[2], size);
    }
    if (lines[0] == "decode") {
        return Decodes(lines[2], size);
    }
    return lines[0] == "netbios" && Converts(lines[2], size);
}

}  // namespace Fuzz
