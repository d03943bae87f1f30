#include "tests/doctor/appliance.h"

#include <ctime>
#include <utility>

#include "tests/doctor/doctor_process.h"
#include "tests/support/authority.h"
#include "tests/support/encoding.h"
#include "tests/support/files.h"
#include "tests/support/token.h"

namespace Test {

namespace {

constexpr int kLifetime = 3600;  // of a token, in seconds

std::string ErrorAnswer(const std::string &error, const std::string &description, const std::string &status) {
    Json::Value answer;
    answer["error"] = error;
    if (!description.empty()) {
        answer["error_description"] = description;
    }
    return HTTPAnswer(Compact(answer), status);
}

/// Test output must not contain these.
void KeepTokenSecret(const std::string &token) {
    const std::size_t claims = token.find('.');
    if (claims != std::string::npos) {
        // State and claims are encoded alike and both have a nonce, so twelve bytes can be equal.
        KeepSecret(token.substr(claims + 1), 20);
    }
}

}  // namespace

Json::Value GoodClaims(Profile profile) {
    Json::Value claims = TokenClaims(profile);
    claims["aud"] = kClientID;
    claims["exp"] = Json::Int64(std::time(nullptr) + kLifetime);
    if (profile == Profile::kAzure) {
        claims["tid"] = kTenant;
    }
    return claims;
}

std::string MakeToken(const Json::Value &header, const Json::Value &claims) {
    return SignedToken(header, claims, kClientSecret);
}

std::string GoodToken(Profile profile) { return MakeToken(TokenHeader(profile), GoodClaims(profile)); }

Appliance::Appliance(Profile profile, const Credentials &credentials)
    : profile_(profile), token_(GoodToken(profile)), server_(credentials) {
    KeepSecret(kClientSecret);
    KeepSecret(kCode);
    KeepTokenSecret(token_);

    for (const char *endpoint : {"authorization_endpoint", "token_endpoint", "end_session_endpoint"}) {
        discovery_[endpoint] = URL("/" + std::string(endpoint));
    }
    discovery_["issuer"] = URL("");
    discovery_["jwks_uri"] = URL("/keys");
    discovery_["id_token_signing_alg_values_supported"].append(profile == Profile::kAzure ? "RS256" : "HS256");
    discovery_["token_endpoint_auth_methods_supported"].append("client_secret_post");

    client_[Key("wellknown")] = URL("/discovery");
    client_[Key("client_id")] = kClientID;
    client_[Key("client_secret")] = kClientSecret;
    client_[Key("authorization_endpoint")] = discovery_["authorization_endpoint"];
    client_[Key("token_endpoint")] = discovery_["token_endpoint"];
    client_[Key("logout_endpoint")] = discovery_["end_session_endpoint"];
    client_[Key("redirect_uri")] = kReturnURI;
    if (profile == Profile::kAzure) {
        client_[Key("sso_enable")] = true;
        client_[Key("tenant_id")] = kTenant;
    }

    RemoveFiles();
    TrustAuthority();
    WriteFile(kProfileFile, profile == Profile::kAzure ? R"({"sso_enable": true, "sso_profile": "azure"})"
                                                       : R"({"sso_enable": true, "sso_profile": "websphere"})");
    WriteFile(kDomainTable, R"({"corp.example": "CORP"})");
    WriteClientFile();

    answers_["/discovery"] = [this](const std::string & /*request*/) { return HTTPAnswer(Compact(discovery_)); };
    answers_["/keys"] = [](const std::string & /*request*/) { return HTTPAnswer(KeySet()); };
    answers_["/authorization_endpoint"] = [](const std::string & /*request*/) { return HTTPAnswer("who are you?"); };
    answers_["/token_endpoint"] = [this](const std::string &request) { return AnswerCode(request); };
    server_.Play([this](Connection &connection) { Serve(connection); });
}

std::string Appliance::ClientFile() const { return profile_ == Profile::kAzure ? kAzureFile : kWebSphereFile; }

std::string Appliance::Key(const std::string &name) const {
    return (profile_ == Profile::kAzure ? "azure_" : "websphere_") + name;
}

void Appliance::ChangeClientFile(const std::string &changes) {
    client_ = Change(client_, changes);
    WriteClientFile();
}

void Appliance::ChangeDiscovery(const std::string &changes) {
    const Lock lock(mutex_);
    discovery_ = Change(discovery_, changes);
}

void Appliance::SetClient(const std::string &name, const Json::Value &value) {
    client_[Key(name)] = value;
    WriteClientFile();
}

void Appliance::MoveEndpoint(const std::string &name, const std::string &url) {
    SetClient(name, url);
    const Lock lock(mutex_);
    discovery_[name] = url;
}

void Appliance::AnswerAt(const std::string &path, Answer answer) {
    const Lock lock(mutex_);
    answers_[path] = std::move(answer);
}

void Appliance::AnswerAt(const std::string &path, const std::string &body, const std::string &status) {
    AnswerAt(path, [answer = HTTPAnswer(body, status)](const std::string & /*request*/) { return answer; });
}

void Appliance::RefuseCodes(const std::string &error, const std::string &description) {
    AnswerAt("/token_endpoint", [answer = ErrorAnswer(error, description, "400 Bad Request")](
                                    const std::string & /*request*/) { return answer; });
}

void Appliance::GiveToken(const std::string &token) {
    KeepTokenSecret(token);
    const Lock lock(mutex_);
    token_ = token;
}

void Appliance::GiveToken(const std::string &headerChanges, const std::string &claimChanges) {
    GiveToken(MakeToken(Change(TokenHeader(profile_), headerChanges), Change(GoodClaims(profile_), claimChanges)));
}

void Appliance::WriteClientFile() const { WriteFile(ClientFile(), Compact(client_)); }

void Appliance::Serve(Connection &connection) {
    server_.Play([this](Connection &next) { Serve(next); });
    ++connections_;
    const std::string request = connection.ReceiveRequest();
    if (!request.empty()) {
        connection.Send(AnswerTo(request));
    }
}

std::string Appliance::AnswerTo(const std::string &request) {
    const Lock lock(mutex_);
    const std::string line = request.substr(0, request.find(" HTTP/1.1"));
    const std::string path = line.substr(0, line.find('?'));
    const auto answer = answers_.find(path.substr(path.rfind('/')));
    return answer != answers_.end() ? answer->second(request) : HTTPAnswer("no such page", "404 Not Found");
}

std::string Appliance::AnswerCode(const std::string &request) const {
    const std::string form = PercentDecode(request.substr(request.find("\r\n\r\n")));
    const auto holds = [&](const std::string &parameter) { return form.find(parameter) != std::string::npos; };
    if (!holds("client_id=" + std::string(kClientID)) || !holds("client_secret=" + std::string(kClientSecret))) {
        return ErrorAnswer("invalid_client", "", "401 Unauthorized");
    }
    if (!holds("code=" + std::string(kCode))) {
        return ErrorAnswer("invalid_grant", "", "400 Bad Request");
    }
    return HTTPAnswer(TokenResponse(token_));
}

}  // namespace Test
