#ifndef TAVOSSO_TESTS_UNIT_FIXTURE_H
#define TAVOSSO_TESTS_UNIT_FIXTURE_H

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "tests/support/failure.h"
#include "tests/support/files.h"
#include "tests/support/system_log.h"

namespace Test {

/// Starts each test as root, with an empty /usr/tavo, no reachable server and no failing call. Fails if a test leaves
/// unread log lines.
class Library : public testing::Test {
  protected:
    void SetUp() override;
    void TearDown() override;
};

}  // namespace Test

#endif
