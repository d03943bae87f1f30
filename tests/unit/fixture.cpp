#include "tests/unit/fixture.h"

#include "tests/support/interposed/calls.h"
#include "tests/support/interposed/clock.h"
#include "tests/support/interposed/platform_calls.h"
#include "tests/support/interposed/process.h"
#include "tests/support/interposed/transport.h"

namespace Test {

void Library::SetUp() {
    RemoveFiles();
    ResetTransport();
    ReplacePlatform({});
    FailNothing();
    RestoreProcess();
    RestoreClock();
    TakeSystemLog();
}

void Library::TearDown() {
    FailNothing();
    RestoreProcess();
    RestoreClock();
    EXPECT_THAT(TakeSystemLog(), testing::IsEmpty());
}

}  // namespace Test
