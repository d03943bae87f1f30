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
#include "doctor/watch.h"
#include "web/nonce.h"
#include "web/request.h"
#include "web/text.h"

namespace Doctor {

namespace {

/// A terminal that does not show what is typed, for the code in it, and takes lines of any length. As it was at the
/// end.
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

    /// Whoever gives up wants to see what they type next.
    static void RestoreAndEnd(int signal) {
        tcsetattr(STDIN_FILENO, TCSANOW, &before);
        std::signal(signal, SIG_DFL);
        std::raise(signal);
    }

    static termios before;  // of the one terminal that there is
    bool isTerminal_;
};

termios SilentTerminal::before{};

std::string ReadAddress() {
    std::string address;
    std::getline(std::cin, address);
    return boost::trim_copy(address);
}

/// What the provider is told by the address that the browser opens.
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
        const SilentTerminal silent;  // before it is asked for: someone may be quick
        report_.Say(
            "Open this address in a browser, and sign in:\n\n  " + Printable(uri) +
            "\n\nThe provider then sends the browser to " + Printable(client_->GetRedirectURI()) +
            ".\nCopy the whole address that it was sent to, with the code in it. Should the page there replace it at\n"
            "once, look for it in the browser's network tools, or end this and take a redirect URI that nobody\n"
            "serves, if one is registered (--redirect-uri). An error page of the provider tells what is wrong.\n\n"
            "Paste the address here, and press Enter. It is not shown.\n");
        return ReadAddress();
    }

    bool CheckAnswer(const TAVO::Web::Parameters &answer, const std::string &state) {
        const std::string error = TAVO::Web::OnlyValue(answer, "error").value_or("");
        const auto code = TAVO::Web::OnlyValue(answer, "code");
        report_.Hide(code.value_or(""));
        if (!error.empty()) {
            Json::Value told;
            told["error"] = error;
            told["error_description"] = TAVO::Web::OnlyValue(answer, "error_description").value_or("");
            report_.Finding("login.answer", "answer of the provider", ErrorText(told),
                            "look for this error in the provider's documentation");
            return false;
        }
        if (!code || code->empty()) {
            report_.Finding("login.answer", "answer of the provider", "that is no address with one code in it",
                            "copy the whole address that the provider sent the browser to");
            return false;
        }
        report_.Good("login.answer", "answer of the provider", "a code");
        if (TAVO::Web::OnlyValue(answer, "state") != state) {
            report_.Finding("login.state", "state", "is not the one that was sent",
                            "take the address of this very login; a provider has to give the state back unchanged");
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
                         "run tavosso-doctor, which looks at the token endpoint and the client", TextOf(failure)});
            return;
        }
        report_.Good("login.exchange", "exchange of the code", "the provider has given an ID token");
        const std::string token = client_->GetToken();
        CheckToken(report_, client_, token, true);
        CheckNonce(token, nonce);
    }

    static std::string FoundIn(const std::string &response) {
        const Json::Value answer = TAVO::Web::ParseObject(response);
        return response.empty()            ? "no answer"
               : !answer.isObject()        ? "the answer is no JSON"
               : !answer.isMember("error") ? "the answer has no \"id_token\", and tells of no error"
                                           : ErrorText(answer);
    }

    void CheckNonce(const std::string &token, const std::string &nonce) {
        Json::Value sent;
        sent["nonce"] = TAVO::SSO::MD5Digest(nonce);
        try {
            TAVO::Web::RequireNonce(TAVO::JWT::Jwt(token).GetBody(), sent);
            report_.Good("login.nonce", "nonce", "the token is of this login");
        } catch (const std::exception &) {
            report_.Finding("login.nonce", "nonce", "the token is not of this login",
                            "the provider has to put the nonce into the token: without it a front end refuses");
        }
    }

    Report &report_;
    Client &client_;
};

}  // namespace

bool WalkLogin(Report &report, Client &client) { return LoginWalk(report, client).Run(); }

}  // namespace Doctor
