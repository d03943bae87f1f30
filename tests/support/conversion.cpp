#include "tests/support/conversion.h"

namespace Test {

namespace {

constexpr bool kAsksWinbind = TAVOSSO_WINBIND;  // 0 where the build leaves it out

std::string Line(const std::string &domain, const std::string &why) {
    return "platform:N domain '" + domain + "' is not in domains.conf, and winbindd " +
           (kAsksWinbind ? why : "cannot be asked: left out of this build");
}

}  // namespace

std::string UnknownDomain(const std::string &domain) { return Line(domain, "is not available"); }

std::string EmptyDomain() { return Line("", "does not know it"); }

}  // namespace Test
