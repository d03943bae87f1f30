#ifndef TAVOSSO_TESTS_SUPPORT_INTERPOSED_TRANSPORT_H
#define TAVOSSO_TESTS_SUPPORT_INTERPOSED_TRANSPORT_H

#include <curl/curl.h>

#include <functional>
#include <map>
#include <string>
#include <vector>

// This program defines the libcurl calls of the library under test: what it would send is written down, and the answers
// are scripted. (Real transfers are in tests/loopback.)
namespace Test {

struct Answer {
    CURLcode result = CURLE_OK;
    std::vector<std::string> chunks;  // one call of the write callback each
};

struct Transport {
    /// By URL. A URL without an answer cannot be connected to.
    std::map<std::string, Answer> answers;

    /// Every call in order, as "name" or "curl_easy_setopt OPTION VALUE".
    std::vector<std::string> calls;

    /// The URLs asked for, and the form of the last POST.
    std::vector<std::string> urls;
    std::string form;

    /// What else happens in a transfer.
    std::function<void()> duringPerform;

    /// Whether the next handle cannot be made.
    bool noHandle = false;
};

/// The transport of the current test.
Transport &CurrentTransport();
void ResetTransport();

/// An answer that arrives whole.
Answer Whole(const std::string &body);

/// libcurl's text for a URL without an answer. It differs between versions.
extern const std::string kNotConnected;

}  // namespace Test

#endif
