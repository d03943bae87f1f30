#ifndef TAVOSSO_TESTS_DOCTOR_APPLIANCE_H
#define TAVOSSO_TESTS_DOCTOR_APPLIANCE_H

#include <json/json.h>

#include <atomic>
#include <functional>
#include <map>
#include <mutex>
#include <string>
#include <vector>

#include "tests/loopback/loopback_provider.h"
#include "tests/support/server.h"

// A completely configured machine and its provider. The provider answers any number of requests in any order. It uses
// the real clock, because the doctor is another process.
namespace Test {

constexpr char kClientSecret[] = "q7Zp-Lw2x&K%9vTe Rb4n+Ym8s";
constexpr char kClientID[] = "7b1c9f0e-2d3a-4c5b-8e6f-1a2b3c4d5e6f";
constexpr char kCode[] = "0.AXkA-good/code&of-one=sign-in";
constexpr char kTenant[] = "4f6d2c1e-9b7a-4c3d-8e5f-0a1b2c3d4e5f";
constexpr char kReturnURI[] = "https://nas.example/webman/sso/return.cgi";

/// Claims of a token issued now.
Json::Value GoodClaims(Profile profile);

/// Signs with the header's "alg".
std::string MakeToken(const Json::Value &header, const Json::Value &claims);
std::string GoodToken(Profile profile);

class Appliance {
  public:
    using Answer = std::function<std::string(const std::string &request)>;  // both verbatim

    explicit Appliance(Profile profile, const Credentials &credentials = CertificateFor("IP:127.0.0.1"));

    Profile profile() const { return profile_; }
    std::string ClientFile() const;

    /// The key in the client's file: "azure_" or "websphere_" and the name.
    std::string Key(const std::string &name) const;

    /// Merges JSON into the client's file and the discovery document. A null removes a member.
    void ChangeClientFile(const std::string &changes);
    void ChangeDiscovery(const std::string &changes);

    void SetClient(const std::string &name, const Json::Value &value);

    /// Sets an endpoint in the client's file and in the discovery document.
    void MoveEndpoint(const std::string &name, const std::string &url);

    /// Sets the response for paths that end in "/discovery", "/keys" or "/token".
    void AnswerAt(const std::string &path, Answer answer);
    void AnswerAt(const std::string &path, const std::string &body, const std::string &status = "200 OK");

    /// The response of the token endpoint to any code.
    void RefuseCodes(const std::string &error, const std::string &description = "");

    /// The token that the provider returns for its code.
    void GiveToken(const std::string &token);
    void GiveToken(const std::string &headerChanges, const std::string &claimChanges);
    std::string Token() const { return token_; }

    std::string URL(const std::string &path) const { return server_.URL("/" + std::string(kTenant) + path); }
    std::vector<std::string> Requests() const { return server_.Requests(); }

    int Connections() const { return connections_; }

    Outcome LogIn() const { return Test::LogIn(kCode); }

  private:
    using Lock = std::lock_guard<std::mutex>;

    void WriteClientFile() const;
    void Serve(Connection &connection);
    std::string AnswerTo(const std::string &request);
    std::string AnswerCode(const std::string &request) const;

    Profile profile_;
    Json::Value client_;
    Json::Value discovery_;
    std::string token_;
    std::atomic<int> connections_{0};
    std::mutex mutex_;
    std::map<std::string, Answer> answers_;
    Server server_;  // last, because its thread uses the other members
};

}  // namespace Test

#endif
