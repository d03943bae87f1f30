#ifndef TAVOSSO_TESTS_SUPPORT_INTERPOSED_PLATFORM_CALLS_H
#define TAVOSSO_TESTS_SUPPORT_INTERPOSED_PLATFORM_CALLS_H

#include <cstddef>
#include <functional>
#include <string>

// This program defines the platform's functions, which pass on to the stand-in unless a test puts its own in place.
namespace Test {

struct Platform {
    std::function<int(const char *src, char *dst, std::size_t size)> urlEncode;
    std::function<int(const std::string &src, char *dst, int flag1, std::size_t size, int flag2, int flag3)> encode;
    std::function<int(const std::string &src, char *dst, std::size_t *length)> decode;
    std::function<int(const char *src, char *dst, std::size_t size)> fqdn2Netbios;
};

/// Puts the given functions in place of the stand-in's.
void ReplacePlatform(Platform platform);

}  // namespace Test

#endif
