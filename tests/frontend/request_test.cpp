#include "web/request.h"

#include <gmock/gmock.h>

using namespace TAVO::Web;

namespace {

TEST(Query, DecodesValuesAndIgnoresRepeatedParameters) {
    const Parameters parameters = ParseQuery("a=%2Fx+y%3d&b&c=1&c=2&&d=%zz%4");
    EXPECT_EQ(OnlyValue(parameters, "a"), "/x y=");
    EXPECT_EQ(OnlyValue(parameters, "b"), "");
    EXPECT_EQ(OnlyValue(parameters, "c"), std::nullopt);
    EXPECT_EQ(OnlyValue(parameters, "d"), "%zz%4");
    EXPECT_EQ(OnlyValue(parameters, "e"), std::nullopt);
}

}  // namespace
