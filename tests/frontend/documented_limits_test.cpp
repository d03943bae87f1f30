#include <gmock/gmock.h>
#include <sso/limits.h>

#include <fstream>
#include <sstream>

#include "frontend/cgi_program.h"

// Compares the limits in the documents with the sources.
namespace {

/// A file of the project, with line breaks replaced by blanks.
std::string Read(const std::string &file) {
    std::ifstream stream(TAVOSSO_SOURCES "/" + file);
    std::ostringstream text;
    for (std::string line; std::getline(stream, line);) {
        text << line << ' ';
    }
    return text.str();
}

std::string Bytes(std::size_t limit) { return std::to_string(limit) + " bytes"; }

TEST(DocumentedLimits, MatchSecretAndStateLimits) {
    for (const char *file : {"sso/sso.h", "docs/configuration.md", "docs/man/tavosso-websphere.conf.5"}) {
        EXPECT_THAT(Read(file), testing::HasSubstr(Bytes(TAVO::SSO::kLongestSecret))) << file;
    }
    EXPECT_THAT(Read("sso/sso.h"), testing::HasSubstr(Bytes(TAVO::SSO::kLongestState)));
}

TEST(DocumentedLimits, MatchTimeLimit) {
    const std::string program = std::to_string(Frontend::kLongestRun) + " seconds";
    for (const char *file : {"frontend/lighttpd.conf", "docs/integration.md", "docs/operations.md"}) {
        EXPECT_THAT(Read(file), testing::HasSubstr(program)) << file;
    }
}

}  // namespace
