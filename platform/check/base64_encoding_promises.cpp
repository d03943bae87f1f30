#include "platform/check/base64_reference.h"
#include "platform/check/buffer.h"
#include "platform/check/child_process.h"
#include "platform/check/guarded_memory.h"
#include "platform/check/promise.h"
#include "sso/limits.h"

namespace PlatformCheck {

namespace {

using TAVO::SSO::kLongestEncoded;
using TAVO::SSO::kPlatformBuffer;

constexpr char kFunction[] = "TLIBCBase64SzEncodeFull";
constexpr char kSample[] = "four";
constexpr std::size_t kLengths[] = {0, 1, 2, 3, 4, 300};

std::string Call(const std::string &bytes, std::size_t size) {
    return std::string(kFunction) + '(' + Quoted(bytes) + ", size " + std::to_string(size) + ')';
}

int Encode(const Subject &subject, const char *src, std::size_t length, char *dst, std::size_t size) {
    NoteCall(Call(src != nullptr ? std::string(src, length) : "", size));
    return subject.functions.encodeBase64(src, length, dst, 1, size, 0, 1);
}

void ExpectEncoded(const Subject &subject, const std::string &bytes, std::size_t size) {
    Buffer buffer(size);
    Expect(Encode(subject, bytes.data(), bytes.size(), buffer.Data(), size) != 0, Call(bytes, size) + " returns 0");
    ExpectEqual(buffer.Text(), Base64(bytes), Call(bytes, size));
}

void EncodesEachByte(const Subject &subject) {
    for (const std::string &bytes : ShortInputs()) {
        ExpectEncoded(subject, bytes, kPlatformBuffer);
    }
}

void EncodesOnOneLine(const Subject &subject) {
    for (std::size_t size = 49; size <= kLongestEncoded; ++size) {
        ExpectEncoded(subject, LongInput(size), kPlatformBuffer);
    }
}

void AcceptsNullWithoutBytes(const Subject &subject) {
    Buffer buffer(kPlatformBuffer);
    Expect(Encode(subject, nullptr, 0, buffer.Data(), buffer.Size()) != 0, "null with len 0: returns 0");
    ExpectEqual(buffer.Text(), "", "null with len 0");
}

void FillsBuffer(const Subject &subject) {
    for (const std::size_t length : kLengths) {
        const std::string bytes = LongInput(length);
        ExpectEncoded(subject, bytes, Base64(bytes).size() + 1);
    }
}

void RequiresRoomForNUL(const Subject &subject) {
    for (const std::size_t length : kLengths) {
        const std::string bytes = LongInput(length);
        const std::size_t size = Base64(bytes).size();
        Buffer buffer(size);
        Expect(Encode(subject, bytes.data(), bytes.size(), buffer.Data(), size) == 0,
               Call(bytes, size) + " succeeds without room for the NUL");
    }
}

void RejectsLongInput(const Subject &subject) {
    for (std::size_t size = 0; size < Base64(kSample).size(); ++size) {
        Buffer buffer(size);
        Expect(Encode(subject, kSample, sizeof kSample - 1, buffer.Data(), size) == 0,
               Call(kSample, size) + " succeeds");
    }
}

void RejectsNull(const Subject &subject) {
    Buffer buffer(kPlatformBuffer);
    NoteCall("null with len 1");
    Expect(subject.functions.encodeBase64(nullptr, 1, buffer.Data(), 1, buffer.Size(), 0, 1) == 0,
           "null with len 1: succeeds");
    Expect(buffer.IsUntouched(), "null with len 1: writes to dst");
    NoteCall("dst is null");
    Expect(subject.functions.encodeBase64(kSample, 4, nullptr, 1, kPlatformBuffer, 0, 1) == 0, "dst is null: succeeds");
}

void LeavesBufferUntouchedOnFailure(const Subject &subject) {
    for (std::size_t size = 0; size <= Base64(kSample).size(); ++size) {
        Buffer buffer(size);
        const int result = Encode(subject, kSample, sizeof kSample - 1, buffer.Data(), size);
        Expect(result != 0 || buffer.IsUntouched(), Call(kSample, size) + " fails and writes to dst");
    }
}

void WritesOnlyToBuffer(const Subject &subject) {
    for (std::size_t size = 0; size <= Base64(kSample).size() + 1; ++size) {
        const GuardedOutput output(size);
        Encode(subject, kSample, sizeof kSample - 1, output.Data(), size);
    }
}

void ReadsOnlyInput(const Subject &subject) {
    for (const std::size_t length : kLengths) {
        const GuardedInput input(LongInput(length));
        Buffer buffer(kPlatformBuffer);
        Encode(subject, input.Data(), length, buffer.Data(), buffer.Size());
    }
}

void WorksAfterFailures(const Subject &subject) {
    for (const std::size_t size : {std::size_t{0}, std::size_t{1}, Base64(kSample).size() / 2}) {
        Buffer buffer(size);
        Encode(subject, kSample, sizeof kSample - 1, buffer.Data(), size);
        ExpectEncoded(subject, kSample, kPlatformBuffer);
    }
}

void LeavesProcessUnchanged(const Subject &subject) {
    ExpectProcessUnchanged([&] {
        Buffer buffer(kPlatformBuffer);
        Encode(subject, kSample, sizeof kSample - 1, buffer.Data(), buffer.Size());
        Encode(subject, kSample, sizeof kSample - 1, buffer.Data(), 1);
    });
}

}  // namespace

std::vector<Promise> Base64EncodingPromises() {
    return {{kFunction, "encodes each byte, and 0 to 48 bytes", EncodesEachByte},
            {kFunction, "encodes up to 765 bytes on one line", EncodesOnOneLine},
            {kFunction, "accepts a null src with len 0", AcceptsNullWithoutBytes},
            {kFunction, "fills the buffer up to its size", FillsBuffer},
            {kFunction, "rejects a text without room for its NUL", RequiresRoomForNUL},
            {kFunction, "rejects a text that does not fit", RejectsLongInput},
            {kFunction, "rejects null pointers", RejectsNull},
            {kFunction, "leaves dst untouched on failure", LeavesBufferUntouchedOnFailure},
            {kFunction, "writes only to its buffer", WritesOnlyToBuffer},
            {kFunction, "only reads its len bytes", ReadsOnlyInput},
            {kFunction, "works after failures", WorksAfterFailures},
            {kFunction, "leaves the process unchanged", LeavesProcessUnchanged}};
}

}  // namespace PlatformCheck
