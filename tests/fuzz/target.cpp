#include "tests/fuzz/target.h"

#include <algorithm>
#include <iostream>
#include <sstream>
#include <stdexcept>

namespace Fuzz {

namespace {

constexpr std::size_t kShortestSecret = 16;

std::string Text(const std::vector<Test::LogLine> &log) {
    std::ostringstream text;
    for (const Test::LogLine &line : log) {
        text << line << "\n";
    }
    return text.str();
}

template <typename Value>
std::string Shown(const Value &value) {
    std::ostringstream text;
    text << value;
    return text.str();
}

}  // namespace

void Require(bool condition, const std::string &property) {
    if (!condition) {
        std::cerr << "Violated property: " << property << std::endl;
        throw ViolatedProperty{property};
    }
}

void RequireSame(const Test::Failure &failure, const Test::Failure &expected) {
    const bool hasFixedText = expected.type != typeid(std::logic_error).name();
    Require(hasFixedText ? failure == expected : failure.type == expected.type,
            "expected " + Shown(expected) + ", got " + Shown(failure));
}

void RequireOneOf(const Test::Failure &failure, const std::vector<Test::Failure> &expected) {
    Require(std::find(expected.begin(), expected.end(), failure) != expected.end(),
            "unexpected failure: " + Shown(failure));
}

void RequireLog(const std::vector<std::string> &expected) {
    std::vector<Test::LogLine> lines;
    for (const std::string &text : expected) {
        lines.push_back(Test::Error(text));
    }
    const std::vector<Test::LogLine> log = Test::TakeSystemLog();
    Require(log == lines, "expected log:\n" + Text(lines) + "got:\n" + Text(log));
}

void RequireNotIn(const std::vector<Test::LogLine> &log, std::initializer_list<std::string> secrets) {
    for (const std::string &secret : secrets) {
        for (const Test::LogLine &line : log) {
            Require(secret.size() < kShortestSecret || line.text.find(secret) == std::string::npos,
                    "secret in the log: " + line.text);
        }
    }
}

std::vector<std::string> Lines(const std::string &input, std::size_t count) {
    std::vector<std::string> lines;
    std::size_t begin = 0;
    while (lines.size() + 1 < count) {
        const std::size_t end = std::min(input.find('\n', begin), input.size());
        lines.push_back(input.substr(begin, end - begin));
        begin = std::min(end + 1, input.size());
    }
    lines.push_back(input.substr(begin));
    return lines;
}

}  // namespace Fuzz
