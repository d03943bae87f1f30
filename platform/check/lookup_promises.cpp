#include <algorithm>

#include "platform/check/buffer.h"
#include "platform/check/child_process.h"
#include "platform/check/guarded_memory.h"
#include "platform/check/log_lines.h"
#include "platform/check/promise.h"
#include "sso/limits.h"

namespace PlatformCheck {

namespace {

constexpr char kFunction[] = "TAVOWinsUserNameFqdn2Netbios";
constexpr char kUnknownDomain[] = "TAVOSSO-PLATFORM-CHECK.INVALID";  // cannot exist (RFC 6761, section 6.4)
constexpr char kUnknownName[] = "TAVOSSO-PLATFORM-CHECK.INVALID\\alice";
constexpr std::size_t kUsableSize = TAVO::SSO::kPlatformBuffer - 1;

std::string Call(const char *src, std::size_t size) {
    return std::string(kFunction) + '(' + (src != nullptr ? Quoted(src) : "null") + ", size " + std::to_string(size) +
           ')';
}

int LookUp(const Subject &subject, const char *src, char *dst, std::size_t size) {
    NoteCall(Call(src, size));
    return subject.functions.lookUp(src, dst, size);
}

/// Returns the domain of --lookup, which is known, or one that is not.
std::string DomainOf(const Subject &subject) {
    return subject.conversion ? subject.conversion->name.substr(0, subject.conversion->name.find('\\'))
                              : kUnknownDomain;
}

void ExpectConverted(const Subject &subject, std::size_t size) {
    const auto &[name, expected] = *subject.conversion;
    Buffer buffer(size);
    const int result = LookUp(subject, name.c_str(), buffer.Data(), size);
    Expect(result >= 0, Call(name.c_str(), size) + " returns " + std::to_string(result));
    ExpectEqual(buffer.Text(), expected, Call(name.c_str(), size));
}

void ExpectRejected(const Subject &subject, const std::string &name, std::size_t size = kUsableSize) {
    Buffer buffer(size);
    const int result = LookUp(subject, name.c_str(), buffer.Data(), size);
    Expect(result < 0, Call(name.c_str(), size) + " returns " + std::to_string(result));
}

/// One name for each reason to reject it.
std::vector<std::string> RejectedNames(const Subject &subject) {
    return {"", "alice", DomainOf(subject) + '\\', "\\alice", kUnknownName};
}

void RejectsNameWithoutDomain(const Subject &subject) {
    for (const char *name : {"", "alice", "\\alice"}) {
        ExpectRejected(subject, name);
    }
}

void RejectsNameWithoutUser(const Subject &subject) { ExpectRejected(subject, DomainOf(subject) + '\\'); }

void RejectsUnknownDomain(const Subject &subject) { ExpectRejected(subject, kUnknownName); }

void ExpectOneLine(const std::string &call) {
    const std::size_t count = TakeLogLines().size();
    Expect(count == 1, call + " logs " + std::to_string(count) + " lines");
}

void RejectsNull(const Subject &subject) {
    Buffer buffer(kUsableSize);
    TakeLogLines();  // of the loading
    Expect(LookUp(subject, nullptr, buffer.Data(), kUsableSize) < 0, Call(nullptr, kUsableSize) + " is not negative");
    Expect(buffer.IsUntouched(), Call(nullptr, kUsableSize) + " writes to dst");
    ExpectOneLine(Call(nullptr, kUsableSize));
    NoteCall("dst is null");
    Expect(subject.functions.lookUp(kUnknownName, nullptr, kUsableSize) < 0, "dst is null: the result is not negative");
}

void LogsOneLineForEachRejection(const Subject &subject) {
    TakeLogLines();  // of the loading
    for (const std::string &name : RejectedNames(subject)) {
        Buffer buffer(kUsableSize);
        LookUp(subject, name.c_str(), buffer.Data(), kUsableSize);
        ExpectOneLine(Call(name.c_str(), kUsableSize));
    }
}

void LogsNoControlCharacter(const Subject &subject) {
    const std::string controls = "A\nB\rC\tD\x1b[2J\x7f.";
    for (const std::string &name : {controls + kUnknownName, controls, '\\' + controls, kUnknownName + controls}) {
        Buffer buffer(kUsableSize);
        LookUp(subject, name.c_str(), buffer.Data(), kUsableSize);
        for (const std::string &line : TakeLogLines()) {
            const bool isPrintable = std::none_of(
                line.begin(), line.end(), [](char c) { return static_cast<unsigned char>(c) < ' ' || c == '\x7f'; });
            Expect(isPrintable, Call(name.c_str(), kUsableSize) + " logs " + Quoted(line));
        }
    }
}

void LeavesBufferUntouchedOnFailure(const Subject &subject) {
    for (const std::string &name : RejectedNames(subject)) {
        Buffer buffer(kUsableSize);
        const int result = LookUp(subject, name.c_str(), buffer.Data(), kUsableSize);
        Expect(result >= 0 || buffer.IsUntouched(), Call(name.c_str(), kUsableSize) + " fails and writes to dst");
    }
}

void ReadsOnlyName(const Subject &subject) {
    for (const std::string &name : RejectedNames(subject)) {
        const GuardedInput input(name + '\0');
        Buffer buffer(kUsableSize);
        LookUp(subject, input.Data(), buffer.Data(), kUsableSize);
    }
}

void LeavesProcessUnchanged(const Subject &subject) {
    ExpectProcessUnchanged([&] {
        Buffer buffer(kUsableSize);
        LookUp(subject, kUnknownName, buffer.Data(), kUsableSize);
        if (subject.conversion) {
            LookUp(subject, subject.conversion->name.c_str(), buffer.Data(), kUsableSize);
        }
    });
}

void ConvertsName(const Subject &subject) { ExpectConverted(subject, kUsableSize); }

void FillsBuffer(const Subject &subject) { ExpectConverted(subject, subject.conversion->result.size()); }

void RejectsLongResult(const Subject &subject) {
    for (const std::size_t size : {std::size_t{0}, subject.conversion->result.size() - 1}) {
        ExpectRejected(subject, subject.conversion->name, size);
        ExpectOneLine(Call(subject.conversion->name.c_str(), size));
    }
}

void LeavesBufferUntouchedByLongResult(const Subject &subject) {
    const std::size_t size = subject.conversion->result.size() - 1;
    Buffer buffer(size);
    const int result = LookUp(subject, subject.conversion->name.c_str(), buffer.Data(), size);
    Expect(result >= 0 || buffer.IsUntouched(),
           Call(subject.conversion->name.c_str(), size) + " fails and writes to dst");
}

void WritesOnlyToBuffer(const Subject &subject) {
    const std::size_t exact = subject.conversion->result.size();
    for (const std::size_t size : {std::size_t{0}, exact - 1, exact}) {
        const GuardedOutput output(size + 1);
        LookUp(subject, subject.conversion->name.c_str(), output.Data(), size);
    }
}

void WorksAfterFailures(const Subject &subject) {
    Buffer buffer(kUsableSize);
    LookUp(subject, "alice", buffer.Data(), kUsableSize);
    LookUp(subject, kUnknownName, buffer.Data(), kUsableSize);
    LookUp(subject, subject.conversion->name.c_str(), buffer.Data(), 0);
    ExpectConverted(subject, kUsableSize);
}

}  // namespace

std::vector<Promise> LookupPromises() {
    return {{kFunction, "rejects a name without a domain", RejectsNameWithoutDomain},
            {kFunction, "rejects a name without a user", RejectsNameWithoutUser},
            {kFunction, "rejects an unknown domain", RejectsUnknownDomain},
            {kFunction, "rejects null pointers", RejectsNull},
            {kFunction, "logs one line for each rejected name", LogsOneLineForEachRejection},
            {kFunction, "logs no control character of a name", LogsNoControlCharacter},
            {kFunction, "leaves dst untouched on failure", LeavesBufferUntouchedOnFailure},
            {kFunction, "only reads its name, up to the NUL", ReadsOnlyName},
            {kFunction, "leaves the process unchanged", LeavesProcessUnchanged},
            {kFunction, "converts the name of --lookup", ConvertsName, true},
            {kFunction, "fills the buffer up to its usable size", FillsBuffer, true},
            {kFunction, "rejects a result that does not fit, with one log line", RejectsLongResult, true},
            {kFunction, "leaves dst untouched if the result does not fit", LeavesBufferUntouchedByLongResult, true},
            {kFunction, "writes only to its buffer", WritesOnlyToBuffer, true},
            {kFunction, "works after failures", WorksAfterFailures, true}};
}

}  // namespace PlatformCheck
