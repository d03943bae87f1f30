#ifndef TAVOSSO_TESTS_UNIT_FIXTURE_H
#define TAVOSSO_TESTS_UNIT_FIXTURE_H

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "tests/support/failure.h"
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

}  // namespace Test

#endif
