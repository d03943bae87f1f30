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

template <typename Function>
Failure FailureOf(Function function) {
    try {
        function();
    } catch (const std::exception &error) {
        return {typeid(error).name(), error.what()};
    }
    return kNothingThrown;
}

}  // namespace Test

#endif
