#ifndef TAVOSSO_TESTS_SUPPORT_INTERPOSED_TRANSPORT_H
#define TAVOSSO_TESTS_SUPPORT_INTERPOSED_TRANSPORT_H

#include <curl/curl.h>

#include <functional>
#include <map>
#include <string>
#include <vector>

// Defines the libcurl functions that the library calls. Records requests and returns scripted answers. tests/loopback
// tests real transfers.
namespace Test {

struct Answer {
    CURLcode result = CURLE_OK;
    std::vector<std::string> chunks;  // one call of the write callback each
};

struct Transport {
    /// By URL. Connections to other URLs fail.
    std::map<std::string, Answer> answers;

    /// All calls in order, as "name" or "curl_easy_setopt OPTION VALUE".
    std::vector<std::string> calls;

    /// The requested URLs, and the form of the last POST.
    std::vector<std::string> urls;
    std::string form;

    /// Called during each transfer.
    std::function<void()> duringPerform;

    /// Makes curl_easy_init fail.
    bool noHandle = false;
};

/// The transport of the current test.
Transport &CurrentTransport();
void ResetTransport();

/// A successful answer in one chunk.
Answer Whole(const std::string &body);

/// libcurl's text for a URL without an answer. It differs between versions.
extern const std::string kNotConnected;

}  // namespace Test

#endif
