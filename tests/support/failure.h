#ifndef TAVOSSO_TESTS_SUPPORT_FAILURE_H
#define TAVOSSO_TESTS_SUPPORT_FAILURE_H

#include <exception>
#include <iosfwd>
#include <string>
#include <typeinfo>

namespace Test {

/// What a call throws: exactly this class, exactly this text.
struct Failure {
    std::string type;
    std::string text;
};

inline const Failure kNothingThrown{"nothing thrown", ""};

bool operator==(const Failure &a, const Failure &b);
std::ostream &operator<<(std::ostream &stream, const Failure &failure);

template <typename Exception>
Failure Fails(const std::string &text) {
    return {typeid(Exception).name(), text};
}

/// The class of an exception, in the words of C++.
std::string ClassOf(const std::exception &error);

/// Throws if the table of failures has no such exception. `FailureOf` and `LogIn` do this with each that they catch.
void RequireInTable(const std::exception &error);

template <typename Function>
Failure FailureOf(Function function) {
    try {
        function();
    } catch (const std::exception &error) {
        RequireInTable(error);
        return {typeid(error).name(), error.what()};
    }
    return kNothingThrown;
}

}  // namespace Test

#endif
