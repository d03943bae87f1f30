#include "doctor/login_walk.h"

#include <jwt/jwt.h>
#include <termios.h>
#include <unistd.h>

#include <boost/algorithm/string/trim.hpp>
#include <csignal>
#include <iostream>
#include <string>

#include "doctor/address.h"
#include "doctor/checks.h"
#include "doctor/explain.h"
#include "doctor/provider_errors.h"
#include "doctor/watch.h"
#include "web/nonce.h"
#include "web/request.h"
#include "web/text.h"

namespace Doctor {

namespace {

/// Switches echo off, because the address contains a code, and accepts lines of any length. Restores the terminal.
class SilentTerminal {
  public:
    SilentTerminal() : isTerminal_(tcgetattr(STDIN_FILENO, &before) == 0) {
        if (isTerminal_) {
            for (const int signal : kEnds) {
                std::signal(signal, RestoreAndEnd);
            }
            termios silent = before;
            silent.c_lflag &= ~static_cast<tcflag_t>(ECHO | ICANON);
            tcsetattr(STDIN_FILENO, TCSANOW, &silent);
        }
    }
    ~SilentTerminal() {
        if (isTerminal_) {
            tcsetattr(STDIN_FILENO, TCSANOW, &before);
            for (const int signal : kEnds) {
                std::signal(signal, SIG_DFL);
            }
        }
    }
    SilentTerminal(const SilentTerminal &) = delete;
    SilentTerminal &operator=(const SilentTerminal &) = delete;

  private:
    static constexpr int kEnds[] = {SIGHUP, SIGINT, SIGQUIT, SIGTERM};

    /// Restores the terminal and ends the process by the same signal.
    static void RestoreAndEnd(int signal) {
        tcsetattr(STDIN_FILENO, TCSANOW, &before);
        std::signal(signal, SIG_DFL);
        std::raise(signal);
    }

    static termios before;
    bool isTerminal_;
};

termios SilentTerminal::before{};

std::string ReadAddress() {
    std::string address;
    std::getline(std::cin, address);
    return boost::trim_copy(address);
}

/// Returns a parameter of the authorization request.
std::string ParameterOf(const std::string &authorizationURI, const char *name) {
    const std::string query = authorizationURI.substr(authorizationURI.rfind('?') + 1);
    return TAVO::Web::OnlyValue(TAVO::Web::ParseQuery(query), name).value_or("");
}

class LoginWalk {
  public:
    LoginWalk(Report &report, Client &client) : report_(report), client_(client) {}

    bool Run() {
        report_.Section("Login");
        const std::string uri = client_.AuthorizationURI(Json::objectValue);
        const std::string address = AskForAddress(uri);
        if (address.empty()) {
            return false;
        }
        const TAVO::Web::Parameters answer = TAVO::Web::ParseQuery(SplitAddress(address).query);
        if (CheckAnswer(answer, ParameterOf(uri, "state"))) {
            Exchange(*TAVO::Web::OnlyValue(answer, "code"), ParameterOf(uri, "nonce"));
        }
        return true;
    }

  private:
    std::string AskForAddress(const std::string &uri) {
        const SilentTerminal silent;  // before the prompt, for input that arrives early
        report_.Say(
            "Open this address in a browser, and sign in:\n\n  " + Printable(uri) +
            "\n\nThe provider then sends the browser to " + Printable(client_->GetRedirectURI()) +
            ".\nCopy the whole address of that page, with the code. If the page replaces the address, copy it from "
            "the\n"
            "browser's network tools, or press Ctrl-C and use a registered redirect URI that no server answers\n"
            "(--redirect-uri). If the provider shows an error page, that page has the cause.\n\n"
            "Paste the address here, and press Enter. It is not shown.\n");
        return ReadAddress();
    }

    bool CheckAnswer(const TAVO::Web::Parameters &answer, const std::string &state) {
        const std::string error = TAVO::Web::OnlyValue(answer, "error").value_or("");
        const auto code = TAVO::Web::OnlyValue(answer, "code");
        report_.Hide(code.value_or(""));
        if (!error.empty()) {
            Json::Value answered;
            answered["error"] = error;
            answered["error_description"] = TAVO::Web::OnlyValue(answer, "error_description").value_or("");
            const TAVO::Web::FailureRow *row = FindProviderError(ErrorText(answered));
            report_.Finding("login.answer", "answer of the provider", ErrorText(answered),
                            row != nullptr ? WithoutBackticks(row->remedy) : "Report this error to the provider.");
            return false;
        }
        if (!code || code->empty()) {
            report_.Finding("login.answer", "answer of the provider", "this is not an address with one code",
                            "Copy the whole address to which the provider sent the browser.");
            return false;
        }
        report_.Good("login.answer", "answer of the provider", "a code");
        if (TAVO::Web::OnlyValue(answer, "state") != state) {
            report_.Finding(
                "login.state", "state", "is not the one that was sent",
                "Copy the address of this login. If it is, the provider changes the state: report it there.");
            return false;
        }
        report_.Good("login.state", "state", "is the one that was sent");
        return true;
    }

    void Exchange(const std::string &code, const std::string &nonce) {
        TakeTransfers();
        client_->SetCode(code);
        std::string response;
        client_->RequestTokenEndpoint(response, client_->GetIDTokenReqParams());
        const std::string log = TakeMessages();
        try {
            client_->ProcessTokenResponse(response);
        } catch (const std::exception &failure) {
            report_.Add({"login.exchange", "exchange of the code", Mark::kFinding, FoundIn(response) + log,
                         "Run: sudo tavosso-doctor. It checks the token endpoint and the client.", TextOf(failure)});
            return;
        }
        report_.Good("login.exchange", "exchange of the code", "the provider sent an ID token");
        const std::string token = client_->GetToken();
        CheckToken(report_, client_, token, true);
        CheckNonce(token, nonce);
    }

    static std::string FoundIn(const std::string &response) {
        const Json::Value answer = TAVO::Web::ParseObject(response);
        return response.empty()            ? "no response"
               : !answer.isObject()        ? "the response is not JSON"
               : !answer.isMember("error") ? R"(the response has no "id_token" and no "error")"
                                           : ErrorText(answer);
    }

    void CheckNonce(const std::string &token, const std::string &nonce) {
        Json::Value sent;
        sent["nonce"] = TAVO::SSO::MD5Digest(nonce);
        try {
            TAVO::Web::RequireNonce(TAVO::JWT::Jwt(token).GetBody(), sent);
            report_.Good("login.nonce", "nonce", "the token belongs to this login");
        } catch (const std::exception &) {
            report_.Finding(
                "login.nonce", "nonce", "the token does not belong to this login",
                "Configure the provider to copy \"nonce\" into the ID token. Front ends reject it otherwise.");
        }
    }

    Report &report_;
    Client &client_;
};

}  // namespace

bool WalkLogin(Report &report, Client &client) { return LoginWalk(report, client).Run(); }

}  // namespace Doctor
