#include <cctype>
#include <cstring>

#include "platform/check/buffer.h"
#include "platform/check/child_process.h"
#include "platform/check/guarded_memory.h"
#include "platform/check/promise.h"

namespace PlatformCheck {

namespace {

constexpr char kFunction[] = "TavoCgiURLEncode";
constexpr char kSample[] = "a&b c/\xc3\xa9";

std::string Call(const char *src, std::size_t size) {
    return std::string(kFunction) + '(' + (src != nullptr ? Quoted(src) : "null") + ", size " + std::to_string(size) +
           ')';
}

int Encode(const Subject &subject, const char *src, char *dst, std::size_t size) {
    NoteCall(Call(src, size));
    return subject.functions.encodeURL(src, dst, size);
}

/// Encodes with more room than needed.
std::string Encoded(const Subject &subject, const std::string &text) {
    Buffer buffer(3 * text.size() + 1);
    const int result = Encode(subject, text.c_str(), buffer.Data(), buffer.Size());
    Expect(result == 0, Call(text.c_str(), buffer.Size()) + " returns " + std::to_string(result));
    return buffer.Text();
}

/// Characters that may appear unescaped in a value (RFC 3986, section 3.4). "&", "=", "+" and, on some servers, ";"
/// separate values.
bool MayStay(char c) {
    return (c >= 'A' && c <= 'Z') || (c >= 'a' && c <= 'z') || (c >= '0' && c <= '9') ||
           (c != '\0' && std::strchr("-._~!$'()*,/:?@", c) != nullptr);
}

bool IsHexDigit(char c) { return std::isxdigit(static_cast<unsigned char>(c)) != 0; }

/// Returns what a server reads. Throws if the text contains a character that must be escaped.
std::string Decoded(const std::string &encoded) {
    std::string text;
    for (std::size_t i = 0; i < encoded.size(); ++i) {
        const char c = encoded[i];
        if (c == '%' && i + 2 < encoded.size() && IsHexDigit(encoded[i + 1]) && IsHexDigit(encoded[i + 2])) {
            text += static_cast<char>(std::stoi(encoded.substr(i + 1, 2), nullptr, 16));
            i += 2;
        } else {
            Expect(c == '+' || MayStay(c), Quoted({c}) + " is not escaped in " + Quoted(encoded));
            text += c == '+' ? ' ' : c;
        }
    }
    return text;
}

void EncodesEachByte(const Subject &subject) {
    std::string all;
    for (int byte = 1; byte < 256; ++byte) {
        const std::string text = {static_cast<char>(byte)};
        ExpectEqual(Decoded(Encoded(subject, text)), text, "decoded result for " + Quoted(text));
        all += text;
    }
    ExpectEqual(Decoded(Encoded(subject, all)), all, "decoded result for all bytes");
}

void EncodesUpToNUL(const Subject &subject) {
    ExpectEqual(Encoded(subject, std::string("ab\0cd", 5)), "ab", Call("ab\0cd", 15));
}

void FillsBuffer(const Subject &subject) {
    for (const std::string text : {"", "a", kSample}) {
        const std::string encoded = Encoded(subject, text);
        Buffer buffer(encoded.size());
        const std::string call = Call(text.c_str(), buffer.Size());
        Expect(Encode(subject, text.c_str(), buffer.Data(), buffer.Size()) == 0, call + " fails");
        ExpectEqual(buffer.Text(), encoded, call);
    }
}

void RejectsLongText(const Subject &subject) {
    const std::size_t needed = Encoded(subject, kSample).size();
    for (std::size_t size = 0; size < needed; ++size) {
        Buffer buffer(size);
        Expect(Encode(subject, kSample, buffer.Data(), size) != 0, Call(kSample, size) + " returns 0");
    }
}

void RejectsNull(const Subject &subject) {
    Buffer buffer(100);
    Expect(Encode(subject, nullptr, buffer.Data(), buffer.Size()) != 0, Call(nullptr, buffer.Size()) + " returns 0");
    Expect(buffer.IsUntouched(), Call(nullptr, buffer.Size()) + " writes to dst");
    NoteCall(Call("a", 100) + " without dst");
    Expect(subject.functions.encodeURL("a", nullptr, 100) != 0, Call("a", 100) + " without dst returns 0");
}

void LeavesBufferUntouchedOnFailure(const Subject &subject) {
    const std::size_t needed = Encoded(subject, kSample).size();
    for (std::size_t size = 0; size < needed; ++size) {
        Buffer buffer(size);
        const int result = Encode(subject, kSample, buffer.Data(), size);
        Expect(result == 0 || buffer.IsUntouched(), Call(kSample, size) + " fails and writes to dst");
    }
}

void WritesOnlyToBuffer(const Subject &subject) {
    for (const std::string text : {"", "a", kSample}) {
        for (std::size_t size = 0; size <= 3 * text.size(); ++size) {
            const GuardedOutput output(size + 1);
            Encode(subject, text.c_str(), output.Data(), size);
        }
    }
}

void ReadsOnlyText(const Subject &subject) {
    for (const std::string text : {"", "a", "%", kSample}) {
        const GuardedInput input(text + '\0');
        Buffer buffer(100);
        Encode(subject, input.Data(), buffer.Data(), buffer.Size());
    }
}

void WorksAfterFailures(const Subject &subject) {
    const std::string before = Encoded(subject, kSample);
    for (const std::size_t size : {std::size_t{0}, std::size_t{1}, std::strlen(kSample)}) {
        Buffer buffer(size);
        Encode(subject, kSample, buffer.Data(), size);
        ExpectEqual(Encoded(subject, kSample), before, Call(kSample, size) + " and then a larger size");
    }
}

void LeavesProcessUnchanged(const Subject &subject) {
    ExpectProcessUnchanged([&] {
        Buffer buffer(100);
        Encode(subject, kSample, buffer.Data(), buffer.Size());
        Encode(subject, kSample, buffer.Data(), 1);
    });
}

}  // namespace

std::vector<Promise> URLEncodingPromises() {
    return {{kFunction, "encodes each byte", EncodesEachByte},
            {kFunction, "encodes up to the NUL", EncodesUpToNUL},
            {kFunction, "fills the buffer up to its usable size", FillsBuffer},
            {kFunction, "rejects a text that does not fit", RejectsLongText},
            {kFunction, "rejects null pointers", RejectsNull},
            {kFunction, "leaves dst untouched on failure", LeavesBufferUntouchedOnFailure},
            {kFunction, "writes only to its buffer", WritesOnlyToBuffer},
            {kFunction, "only reads its text, up to the NUL", ReadsOnlyText},
            {kFunction, "works after failures", WorksAfterFailures},
            {kFunction, "leaves the process unchanged", LeavesProcessUnchanged}};
}

}  // namespace PlatformCheck
