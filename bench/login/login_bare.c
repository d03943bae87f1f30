// The transfers of a login with libcurl's calls as the library makes them, and nothing else: what no relying party that
// makes them so can do without.
//
//   login_bare PROFILE LOGINS PROVIDER
#include <curl/curl.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>

#include "bench/login/exchange.h"
#include "bench/login/logins.h"

struct Answer {
    char *bytes;
    size_t length;
};

static const char *provider;
static const char *profile;

static void Require(int condition, const char *what) {
    if (!condition) {
        fprintf(stderr, "login_bare: %s\n", what);
        exit(1);
    }
}

static size_t Append(char *data, size_t size, size_t count, void *answer) {
    struct Answer *whole = answer;
    whole->bytes = realloc(whole->bytes, whole->length + size * count);
    Require(whole->bytes != NULL, "out of memory");
    memcpy(whole->bytes + whole->length, data, size * count);
    whole->length += size * count;
    return size * count;
}

static void Transfer(const char *path, const char *form) {
    char url[256];
    snprintf(url, sizeof url, "%s/%s%s", provider, profile, path);
    struct Answer answer = {NULL, 0};
    curl_global_init(CURL_GLOBAL_ALL);
    CURL *handle = curl_easy_init();
    curl_easy_setopt(handle, CURLOPT_URL, url);
    if (form != NULL) {
        curl_easy_setopt(handle, CURLOPT_POSTFIELDS, form);
    }
    curl_easy_setopt(handle, CURLOPT_WRITEFUNCTION, Append);
    curl_easy_setopt(handle, CURLOPT_WRITEDATA, &answer);
    const CURLcode result = curl_easy_perform(handle);
    Require(result == CURLE_OK, curl_easy_strerror(result));
    Require(answer.length > 0, "empty answer");
    curl_easy_cleanup(handle);
    curl_global_cleanup();
    free(answer.bytes);
}

static void LogInToAzure(void) {
    Transfer(TOKEN_PATH, TOKEN_REQUEST);
    Transfer(DISCOVERY_PATH, NULL);
    Transfer(KEYS_PATH, NULL);
}

static void LogInToWebSphere(void) { Transfer(TOKEN_PATH, TOKEN_REQUEST); }

int main(int argc, char **argv) {
    Require(argc == 4, "PROFILE LOGINS PROVIDER");
    profile = argv[1];
    provider = argv[3];
    MeasureLogins(strtoul(argv[2], NULL, 10), strcmp(profile, "azure") == 0 ? LogInToAzure : LogInToWebSphere);
}
