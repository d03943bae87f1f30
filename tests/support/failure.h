#ifndef TAVOSSO_TESTS_SUPPORT_FAILURE_H
#define TAVOSSO_TESTS_SUPPORT_FAILURE_H

#include <exception>
#include <iosfwd>
#include <string>
#include <typeinfo>

namespace Test {

/// The exact class and text of an exception.
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

/// The demangled class of an exception.
std::string ClassOf(const std::exception &error);

/// Throws if the failure table has no row for the exception. `FailureOf` and `LogIn` call it for each exception.
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
