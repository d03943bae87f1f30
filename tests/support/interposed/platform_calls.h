#ifndef TAVOSSO_TESTS_SUPPORT_INTERPOSED_PLATFORM_CALLS_H
#define TAVOSSO_TESTS_SUPPORT_INTERPOSED_PLATFORM_CALLS_H

#include <cstddef>
#include <functional>
#include <string>

// Defines the platform's functions. They call the stand-in unless a test replaces them.
namespace Test {

struct Platform {
    std::function<int(const char *src, char *dst, std::size_t size)> urlEncode;
    std::function<int(const std::string &src, char *dst, int flag1, std::size_t size, int flag2, int flag3)> encode;
    std::function<int(const std::string &src, char *dst, std::size_t *length)> decode;
    std::function<int(const char *src, char *dst, std::size_t size)> fqdn2Netbios;
};

/// Replaces the functions that are set; restores the others.
void ReplacePlatform(Platform platform);

}  // namespace Test

#endif
