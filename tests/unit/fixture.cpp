#include "tests/unit/fixture.h"

#include "tests/interposed/calls.h"
#include "tests/interposed/clock.h"
#include "tests/interposed/platform_calls.h"
#include "tests/interposed/process.h"
#include "tests/interposed/transport.h"

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
