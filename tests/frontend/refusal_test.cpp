#include "web/refusal.h"

#include <gmock/gmock.h>

using namespace TAVO::Web;

namespace {

std::string Reason(const std::string &text) { return ReasonOf(std::runtime_error(text)); }

TEST(Reason, UsesTextOfLibrary) { EXPECT_EQ(Reason("id_token expired."), "id_token expired."); }

TEST(Reason, ReportsOnlyErrorOfProviderResponse) {
    EXPECT_EQ(Reason("{\"access_token\":\"SECRET\",\"error\":\"invalid_grant\",\"error_description\":\"used\"}\n"),
              "The provider refused: invalid_grant (used)");
    EXPECT_EQ(Reason("{\"error\":{\"id_token\":\"SECRET\"}}\n"), "The provider refused: unknown error");
}

TEST(Reason, HidesMalformedProviderResponse) {
    EXPECT_EQ(Reason("{\"id_token\":\"SECRET"), "The provider refused: unknown error");
    EXPECT_EQ(Reason(" [\"SECRET\"]"), "The provider refused: unknown error");
    EXPECT_EQ(Reason(std::string(5000, '[')), "The provider refused: unknown error");
}

TEST(Reason, IsOneShortLine) {
    EXPECT_EQ(Reason("a\r\nSet-Cookie: b\n"), "a  Set-Cookie: b");
    EXPECT_EQ(Reason(std::string(5000, 'x')).size(), 200U);
}

TEST(Reason, IsCutAtCharacterBoundary) {
    const std::string most(198, 'x');
    EXPECT_EQ(Reason(most + "xü"), most + "x");
    EXPECT_EQ(Reason(most + "ü"), most + "ü");
    EXPECT_EQ(Reason(most + "€"), most);
}

}  // namespace
