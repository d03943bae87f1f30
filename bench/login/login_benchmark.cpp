// Compares whole logins over TLS with the same transfers made with libcurl only.
#include <curl/curl.h>

#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>

#include "bench/comparison.h"
#include "bench/login/benchmark_provider.h"
#include "sso/sso.h"
#include "tests/support/files.h"

namespace {

using Bench::Comparison;

constexpr char kCode[] = "OAAABAAAAiL9Kn2Z27UubvWFPbm0gLWQJVzCTE9UkP3pSx1aXxUjq3n8b2JRLk4OxVXr";
constexpr double kLimit = 1.02;

bool LogIn() {
    std::string userName;
    TAVO::SSO::OIDCLogin(kCode, userName);
    return !userName.empty();
}

std::size_t Append(char *data, std::size_t size, std::size_t count, void *answer) {
    static_cast<std::string *>(answer)->append(data, size * count);
    return size * count;
}

/// Uses a new handle with the defaults, as the library must.
bool Transfer(const std::string &url, const std::string &form = "") {
    std::string answer;
    curl_global_init(CURL_GLOBAL_ALL);
    CURL *handle = curl_easy_init();
    curl_easy_setopt(handle, CURLOPT_URL, url.c_str());
    if (!form.empty()) {
        curl_easy_setopt(handle, CURLOPT_POSTFIELDS, form.c_str());
    }
    curl_easy_setopt(handle, CURLOPT_WRITEFUNCTION, Append);
    curl_easy_setopt(handle, CURLOPT_WRITEDATA, &answer);
    const CURLcode result = curl_easy_perform(handle);
    curl_easy_cleanup(handle);
    curl_global_cleanup();
    return result == CURLE_OK && !answer.empty();
}

bool TransferOnly(const std::string &profile, const std::string &url) {
    const std::string form =
        "client_id=6731de76-14a6-49ae-97bc-6eba6914391e&client_secret=JqQX2PNo9bpM0uEihUPzyrh&code=" +
        std::string(kCode) + "&grant_type=authorization_code&redirect_uri=https%3A%2F%2Fnas.example%2Freturn";
    return Transfer(url + "/token", form) &&
           (profile != "azure" || (Transfer(url + "/discovery") && Transfer(url + "/keys")));
}

std::string ReadFile(const std::filesystem::path &path) {
    std::ifstream file(path);
    return {std::istreambuf_iterator<char>(file), {}};
}

/// Returns Debian's certificate authorities. tools/private-root hides the usual file.
std::string DebianAuthorities() {
    std::string all;
    for (const auto &entry : std::filesystem::directory_iterator("/usr/share/ca-certificates/mozilla")) {
        all += ReadFile(entry.path());
    }
    return all;
}

Comparison Compare(const std::string &profile, const std::string &url, const std::string &name,
                   const std::string &authorities) {
    const auto prepare = [profile, authorities] {
        Test::WriteFile(Test::kProfileFile, R"({"sso_enable": true, "sso_profile": ")" + profile + "\"}");
        Test::WriteFile(Test::kTrustedAuthorities, authorities);
    };
    return {"login, " + profile + ", " + name,
            LogIn,
            "its transfers",
            [profile, url] { return TransferOnly(profile, url); },
            kLimit,
            prepare};
}

}  // namespace

int main(int argc, char **argv) {
    const Bench::Provider provider;
    const std::string one = ReadFile(Test::kTrustedAuthorities);
    const std::string all = DebianAuthorities() + one;
    return Bench::RunComparisons(
        {
            Compare("azure", provider.URL("azure"), "one authority", one),
            Compare("azure", provider.URL("azure"), "Debian's authorities", all),
            Compare("websphere", provider.URL("websphere"), "one authority", one),
            Compare("websphere", provider.URL("websphere"), "Debian's authorities", all),
        },
        argc, argv);
}
