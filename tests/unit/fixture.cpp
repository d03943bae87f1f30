#include "tests/unit/fixture.h"

#include <ostream>

#include "tests/unit/calls.h"
#include "tests/unit/platform_calls.h"
#include "tests/unit/process.h"
#include "tests/unit/transport.h"

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
