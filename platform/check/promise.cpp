#include "platform/check/promise.h"

#include <algorithm>
#include <cstdio>

#include "platform/check/process_state.h"

namespace PlatformCheck {

namespace {

constexpr std::size_t kMostShown = 60;

std::string Escaped(char c) {
    if (c == '"' || c == '\\') {
        return {'\\', c};
    }
    if (c >= ' ' && c <= '~') {
        return {c};
    }
    char text[5];
    std::snprintf(text, sizeof text, "\\x%02x", static_cast<unsigned>(static_cast<unsigned char>(c)));
    return text;
}

}  // namespace

void Expect(bool isKept, const std::string &otherwise) {
    if (!isKept) {
        throw promise_broken(otherwise);
    }
}

void ExpectEqual(const std::string &found, const std::string &expected, const std::string &call) {
    if (found == expected) {
        return;
    }
    const auto end = std::min(found.size(), expected.size());
    const auto same = static_cast<std::size_t>(
        std::mismatch(found.begin(), found.begin() + static_cast<std::ptrdiff_t>(end), expected.begin()).first -
        found.begin());
    const std::size_t begin = same < kMostShown / 2 ? 0 : same - kMostShown / 2;
    const std::string where = begin == 0 ? "" : " from byte " + std::to_string(begin);
    throw promise_broken(call + ": expected" + where + ' ' + Quoted(expected.substr(begin)) + ", found " +
                         Quoted(found.substr(begin)));
}

void ExpectProcessUnchanged(const std::function<void()> &calls) {
    const ProcessState before = CaptureProcessState();
    calls();
    const std::string difference = FirstDifference(before, CaptureProcessState());
    Expect(difference.empty(), difference);
}

std::string Quoted(const std::string &bytes) {
    std::string quoted = "\"";
    for (const char c : bytes.substr(0, kMostShown)) {
        quoted += Escaped(c);
    }
    quoted += '"';
    return bytes.size() <= kMostShown ? quoted : quoted + "... (" + std::to_string(bytes.size()) + " bytes)";
}

}  // namespace PlatformCheck
