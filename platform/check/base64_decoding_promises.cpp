#include <cstring>

#include "platform/check/base64_reference.h"
#include "platform/check/buffer.h"
#include "platform/check/child_process.h"
#include "platform/check/guarded_memory.h"
#include "platform/check/promise.h"
#include "sso/limits.h"

namespace PlatformCheck {

namespace {

using TAVO::SSO::kPlatformBuffer;

constexpr char kFunction[] = "TLIBCBase64Decode";
constexpr char kSample[] = "Zm91cg==";  // "four"
constexpr std::size_t kSampleSize = 4;
constexpr std::size_t kLengths[] = {0, 1, 2, 3, 4, 300};

std::string Call(const std::string &text, std::size_t size) {
    return std::string(kFunction) + '(' + Quoted(text) + ", size " + std::to_string(size) + ')';
}

int Decode(const Subject &subject, const char *src, std::size_t length, char *dst, std::size_t &size) {
    NoteCall(Call(src != nullptr ? std::string(src, length) : "", size));
    return subject.functions.decodeBase64(src, length, dst, &size);
}

void ExpectDecoded(const Subject &subject, const std::string &bytes, std::size_t size) {
    const std::string text = Base64(bytes);
    Buffer buffer(size);
    std::size_t written = size;
    Expect(Decode(subject, text.data(), text.size(), buffer.Data(), written) != 0, Call(text, size) + " returns 0");
    Expect(written == bytes.size(),
           Call(text, size) + " reports " + std::to_string(written) + " bytes, not " + std::to_string(bytes.size()));
    ExpectEqual(buffer.Bytes(written), bytes, Call(text, size));
}

void ExpectRejected(const Subject &subject, const std::string &text) {
    Buffer buffer(kPlatformBuffer);
    std::size_t size = kPlatformBuffer;
    Expect(Decode(subject, text.data(), text.size(), buffer.Data(), size) == 0,
           Call(text, kPlatformBuffer) + " succeeds");
}

void DecodesEachByte(const Subject &subject) {
    for (const std::string &bytes : ShortInputs()) {
        ExpectDecoded(subject, bytes, kPlatformBuffer);
    }
}

void DecodesLongText(const Subject &subject) {
    for (std::size_t size = 49; size <= kPlatformBuffer; ++size) {
        ExpectDecoded(subject, LongInput(size), kPlatformBuffer);
    }
}

void AcceptsNullWithoutText(const Subject &subject) {
    Buffer buffer(kPlatformBuffer);
    std::size_t size = kPlatformBuffer;
    Expect(Decode(subject, nullptr, 0, buffer.Data(), size) != 0, "null with len 0: returns 0");
    Expect(size == 0, "null with len 0: reports " + std::to_string(size) + " bytes");
}

void FillsBuffer(const Subject &subject) {
    for (const std::size_t length : kLengths) {
        ExpectDecoded(subject, LongInput(length), length);
    }
}

void RejectsLongText(const Subject &subject) {
    for (const std::size_t room : kLengths) {
        const std::string text = Base64(LongInput(room + 1));
        Buffer buffer(room);
        std::size_t size = room;
        Expect(Decode(subject, text.data(), text.size(), buffer.Data(), size) == 0, Call(text, room) + " succeeds");
    }
}

void RejectsMissingPadding(const Subject &subject) {
    for (const char *text : {"Zm8", "Zg=", "Zg", "Z", "Zm9vZm8", "Zm9vZg=", "Zm9vZg", "Zm9vZ"}) {
        ExpectRejected(subject, text);
    }
}

void RejectsExcessPadding(const Subject &subject) {
    for (const char *text : {"=", "==", "===", "====", "Z===", "Zm9v=", "Zm9v==", "Zm9v====", "Zm8==", "Zg===",
                             "Zm8=====", "Zg======", "Zm8=Zm8=", "Zg==Zg==", "Zg==Zm9v", "=m9v", "Z=9v", "Zm=v"}) {
        ExpectRejected(subject, text);
    }
}

void RejectsPaddingBits(const Subject &subject) {
    for (unsigned int value = 0; value < 64; ++value) {
        if ((value & 15) != 0) {
            ExpectRejected(subject, std::string("Z") + kBase64Alphabet[value] + "==");
        }
        if ((value & 3) != 0) {
            ExpectRejected(subject, std::string("Zm") + kBase64Alphabet[value] + "=");
        }
    }
}

void RejectsSpace(const Subject &subject) {
    for (const char *space : {" ", "\n", "\r\n", "\t", "    ", "\n\n\n\n"}) {
        ExpectRejected(subject, std::string(space) + "Zm9v");
        ExpectRejected(subject, std::string("Zm9v") + space);
        ExpectRejected(subject, std::string("Zm9v") + space + "Zm9v");
        ExpectRejected(subject, std::string("Zm") + space + "9v");
    }
}

void RejectsURLSafeAlphabet(const Subject &subject) {
    for (const char *text : {"-_-_", "Zm9-", "Zm9_", "-g==", "Zm_=", "Zm9v-_-_"}) {
        ExpectRejected(subject, text);
    }
}

void RejectsOtherBytes(const Subject &subject) {
    for (int byte = 0; byte < 256; ++byte) {
        const char c = static_cast<char>(byte);
        const bool hasOwnPromise = c != '\0' && std::strchr("=-_ \t\n\r", c) != nullptr;
        if (hasOwnPromise || std::memchr(kBase64Alphabet, c, sizeof kBase64Alphabet - 1) != nullptr) {
            continue;
        }
        for (std::size_t position = 0; position < 8; ++position) {
            std::string text = "Zm9vZm9v";
            text[position] = c;
            ExpectRejected(subject, text);
        }
        ExpectRejected(subject, std::string("Zm9v") + c);
    }
}

void RejectsNull(const Subject &subject) {
    Buffer buffer(kPlatformBuffer);
    std::size_t size = kPlatformBuffer;
    NoteCall("null with len 4");
    Expect(subject.functions.decodeBase64(nullptr, 4, buffer.Data(), &size) == 0, "null with len 4: succeeds");
    Expect(buffer.IsUntouched() && size == kPlatformBuffer, "null with len 4: writes to dst or len_inout");
    NoteCall("dst is null");
    Expect(subject.functions.decodeBase64(kSample, sizeof kSample - 1, nullptr, &size) == 0, "dst is null: succeeds");
    NoteCall("len_inout is null");
    Expect(subject.functions.decodeBase64(kSample, sizeof kSample - 1, buffer.Data(), nullptr) == 0,
           "len_inout is null: succeeds");
}

void LeavesOutputUntouchedOnFailure(const Subject &subject) {
    for (const std::string text : {kSample, "Zm91cg=", "Zm91cg==\n", "Zm91ch==", "Zm91Zm91!"}) {
        for (const std::size_t room : {kSampleSize - 1, kPlatformBuffer}) {
            Buffer buffer(room);
            std::size_t size = room;
            if (Decode(subject, text.data(), text.size(), buffer.Data(), size) == 0) {
                Expect(buffer.IsUntouched(), Call(text, room) + " fails and writes to dst");
                Expect(size == room, Call(text, room) + " fails and sets len_inout to " + std::to_string(size));
            }
        }
    }
}

void WritesOnlyToBuffer(const Subject &subject) {
    for (const std::size_t length : kLengths) {
        const std::string text = Base64(LongInput(length));
        for (std::size_t room = 0; room <= length; ++room) {
            const GuardedOutput output(room);
            std::size_t size = room;
            Decode(subject, text.data(), text.size(), output.Data(), size);
        }
    }
}

void ReadsOnlyText(const Subject &subject) {
    for (const std::string text : {"", "Z", "Zm", "Zm9", "Zm9v", kSample, "Zm91cg=", "Zm91cg"}) {
        const GuardedInput input(text);
        Buffer buffer(kPlatformBuffer);
        std::size_t size = kPlatformBuffer;
        NoteCall(Call(text, size));
        subject.functions.decodeBase64(input.Data(), text.size(), buffer.Data(), &size);
    }
}

void WorksAfterFailures(const Subject &subject) {
    for (const std::string text : {"Zm91cg=", "Zm91cg==\n", "Zm91ch==", "!"}) {
        Buffer buffer(kPlatformBuffer);
        std::size_t size = kPlatformBuffer;
        Decode(subject, text.data(), text.size(), buffer.Data(), size);
        ExpectDecoded(subject, "four", kPlatformBuffer);
    }
}

void LeavesProcessUnchanged(const Subject &subject) {
    ExpectProcessUnchanged([&] {
        for (const std::string text : {kSample, "Zm91cg=", "!!!!"}) {
            Buffer buffer(kPlatformBuffer);
            std::size_t size = kPlatformBuffer;
            Decode(subject, text.data(), text.size(), buffer.Data(), size);
        }
    });
}

}  // namespace

std::vector<Promise> Base64DecodingPromises() {
    return {{kFunction, "decodes each byte, and 0 to 48 bytes", DecodesEachByte},
            {kFunction, "decodes up to 1024 bytes", DecodesLongText},
            {kFunction, "accepts a null src with len 0", AcceptsNullWithoutText},
            {kFunction, "fills the buffer up to its size", FillsBuffer},
            {kFunction, "rejects bytes that do not fit", RejectsLongText},
            {kFunction, "rejects missing padding", RejectsMissingPadding},
            {kFunction, "rejects excess padding", RejectsExcessPadding},
            {kFunction, "rejects padding bits that are not zero", RejectsPaddingBits},
            {kFunction, "rejects line feeds and blanks", RejectsSpace},
            {kFunction, "rejects the URL-safe alphabet", RejectsURLSafeAlphabet},
            {kFunction, "rejects each other byte", RejectsOtherBytes},
            {kFunction, "rejects null pointers", RejectsNull},
            {kFunction, "leaves dst and len_inout untouched on failure", LeavesOutputUntouchedOnFailure},
            {kFunction, "writes only to its buffer", WritesOnlyToBuffer},
            {kFunction, "only reads its len characters", ReadsOnlyText},
            {kFunction, "works after failures", WorksAfterFailures},
            {kFunction, "leaves the process unchanged", LeavesProcessUnchanged}};
}

}  // namespace PlatformCheck
