#include "tests/support/conversion.h"

namespace Test {

namespace {

constexpr bool kHasWinbind = TAVOSSO_WINBIND;  // false if built without winbind

std::string Line(const std::string &domain, const std::string &why) {
    return "platform:N domain '" + domain + "' is not in domains.conf, and winbindd " +
           (kHasWinbind ? why : "cannot be asked: left out of this build");
}

}  // namespace

std::string UnknownDomain(const std::string &domain) { return Line(domain, "is not available"); }

std::string EmptyDomain() { return Line("", "does not know it"); }

}  // namespace Test
