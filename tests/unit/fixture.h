#ifndef TAVOSSO_TESTS_UNIT_FIXTURE_H
#define TAVOSSO_TESTS_UNIT_FIXTURE_H

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>
#include <typeinfo>
#include <vector>

#include "tests/support/files.h"
#include "tests/support/system_log.h"

namespace Test {

/// A process as it is in the ordinary case: root, an empty /usr/tavo, nobody to connect to, every call in order. A test
/// that leaves log lines behind which it has not looked at fails.
class Library : public testing::Test {
  protected:
    void SetUp() override;
    void TearDown() override;
};

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
