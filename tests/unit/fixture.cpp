#include "tests/unit/fixture.h"

#include <ostream>

#include "tests/interposed/calls.h"
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
    TakeSystemLog();
}

void Library::TearDown() {
    FailNothing();
    RestoreProcess();
    EXPECT_THAT(TakeSystemLog(), testing::IsEmpty());
}

bool operator==(const Failure &a, const Failure &b) { return a.type == b.type && a.text == b.text; }

std::ostream &operator<<(std::ostream &stream, const Failure &failure) {
    return stream << failure.type << " \"" << failure.text << "\"";
}

}  // namespace Test
