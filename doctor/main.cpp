// tavosso-doctor: why a login fails, for the administrator at the terminal.
#include <grp.h>
#include <pwd.h>
#include <unistd.h>

#include <CLI/CLI.hpp>
#include <boost/algorithm/string/join.hpp>
#include <boost/algorithm/string/trim.hpp>
#include <cstdlib>
#include <fstream>
#include <iostream>
#include <iterator>
#include <optional>
#include <string>
#include <vector>

#include "doctor/checks.h"
#include "doctor/explain.h"
#include "doctor/login_walk.h"
#include "doctor/watch.h"

namespace {

using Doctor::Client;
using Doctor::Profile;
using Doctor::Report;

enum ExitStatus { kHealthy = 0, kFindings = 1, kCannotRun = 2 };

// A larger one than any provider sends, and a file that was named by mistake is not read into memory.
constexpr std::size_t kLongestToken = std::size_t{1} << 20;

/// The command line, as it was given.
struct Options {
    bool isJson = false;
    bool isVerbose = false;
    long timeout = 10;
    std::string user;
    std::optional<std::string> domain;
    std::string returnProgram = "/webman/sso/return.cgi";
    std::string tokenFile;
    bool mayFetch = false;
    std::string redirectURI;
    std::vector<std::string> words;
    bool isList = false;
    bool isMarkdown = false;
};

/// Why the command cannot run at all.
class cannot_run : public std::runtime_error {
  public:
    using std::runtime_error::runtime_error;
};

/// The rights that a program has which this user starts, with none of root's left to take on again.
void Become(const std::string &name) {
    const passwd *user = getpwnam(name.c_str());
    if (user == nullptr) {
        throw cannot_run("there is no user " + name);
    }
    if (initgroups(user->pw_name, user->pw_gid) != 0 || setresgid(user->pw_gid, user->pw_gid, user->pw_gid) != 0 ||
        setresuid(user->pw_uid, user->pw_uid, user->pw_uid) != 0) {
        throw cannot_run("only root can look with the rights of " + name);
    }
}

std::string ReadToken(const std::string &name) {
    std::ifstream file;
    if (name != "-") {
        file.open(name, std::ios::binary);
        if (!file) {
            throw cannot_run(name + " cannot be read");
        }
    }
    std::istream &stream = name == "-" ? std::cin : file;
    std::string token(kLongestToken + 1, '\0');
    stream.read(token.data(), static_cast<std::streamsize>(token.size()));
    token.resize(static_cast<std::size_t>(stream.gcount()));
    if (token.size() > kLongestToken) {
        throw cannot_run("that is no token: longer than 1 MiB");
    }
    return boost::trim_copy(token);
}

int StatusOf(const Report &report) { return report.HasFindings() ? kFindings : kHealthy; }

int CheckEverything(Report &report, const Options &options) {
    if (const std::optional<Profile> profile = Doctor::CheckProfile(report)) {
        Doctor::TakeLogLines();
        Client client(*profile);
        Doctor::CheckClientFile(report, client, options.returnProgram);
        Doctor::CheckProvider(report, client);
        if (*profile == Profile::kAzure) {
            Doctor::CheckDirectory(report, options.domain);
        }
    }
    report.Finish("check");
    return StatusOf(report);
}

/// The client of the profile in force, for a command that can do nothing without one.
Client RequireClient(Report &report) {
    Report silent({true, false, false});  // a report for machines is printed when it is finished, as this one never is
    const std::optional<Profile> profile = Doctor::CheckProfile(silent);
    if (!profile) {
        throw cannot_run("no profile is in force; tavosso-doctor, without a command, tells why");
    }
    Client client(*profile);
    report.Hide(client->GetClientSecret());
    return client;
}

int CheckOneToken(Report &report, const Options &options) {
    Client client = RequireClient(report);
    Json::Value more;
    more["stops_at"] = Doctor::CheckToken(report, client, ReadToken(options.tokenFile), options.mayFetch);
    report.Finish("token", more);
    return StatusOf(report);
}

int Login(Report &report, const Options &options) {
    if (options.isJson) {
        throw cannot_run("login talks with a person: it has no JSON");
    }
    Client client = RequireClient(report);
    if (!options.redirectURI.empty()) {
        client->SetRedirectURI(options.redirectURI);
    }
    if (!Doctor::WalkLogin(report, client)) {
        throw cannot_run("no address was given");
    }
    report.Finish("login");
    return StatusOf(report);
}

int Explain(const Options &options) {
    if (options.isList != options.words.empty()) {
        throw cannot_run("explain takes either a text or --list");
    }
    if (options.isMarkdown) {
        Doctor::PrintMarkdown();
        return kHealthy;
    }
    const std::vector<Doctor::Explanation> explanations =
        options.isList ? Doctor::AllExplanations() : Doctor::LookUp(boost::join(options.words, " "));
    if (options.isJson) {
        Json::Value json;
        json["version"] = Doctor::kJsonVersion;
        json["command"] = "explain";
        json["explanations"] = Doctor::ExplanationsAsJson(explanations);
        Doctor::WriteJson(json);
    } else if (explanations.empty()) {
        std::cout << "This text is unknown. Try a whole line of the log, or an exception's text.\n";
    } else {
        Doctor::PrintExplanations(explanations);
    }
    return explanations.empty() ? kFindings : kHealthy;
}

}  // namespace

int main(int argc, char **argv) try {
    Options options;
    CLI::App app("Tells why a single sign-on login fails, from this machine's configuration and its provider.",
                 "tavosso-doctor");
    app.set_version_flag("--version", "tavosso-doctor " TAVOSSO_VERSION);
    app.add_flag("--json", options.isJson, "Write one JSON object");
    app.add_flag("--verbose", options.isVerbose, "Show the library's requests and log lines, too");
    app.add_option("--timeout", options.timeout, "Seconds to wait for each answer of the provider")
        ->check(CLI::Range(1L, 3600L))
        ->capture_default_str();
    app.add_option("--user", options.user, "Look with the rights of a program that this user starts");
    app.add_option("--domain", options.domain, "A domain of the users, for asking the directory");
    app.add_option("--return-program", options.returnProgram, "The path of the program that the provider sends back to")
        ->capture_default_str();
    app.require_subcommand(0, 1);
    app.fallthrough();

    CLI::App *token = app.add_subcommand("token", "Verify an ID token as the library does, step by step");
    token->add_option("FILE", options.tokenFile, "A file with the token, or - for standard input")->required();
    token->add_flag("--fetch", options.mayFetch, "Ask the provider for its keys");

    CLI::App *login = app.add_subcommand("login", "Walk through a login from the terminal");
    login->add_option("--redirect-uri", options.redirectURI, "Another one that is registered at the provider");

    CLI::App *explain = app.add_subcommand("explain", "Explain an exception's text or a line of the log");
    explain->add_option("TEXT", options.words, "The text");
    CLI::Option *list = explain->add_flag("--list", options.isList, "Print all that it explains");
    explain->add_flag("--markdown", options.isMarkdown, "Print that as the tables of the documents")->needs(list);

    try {
        app.parse(argc, argv);
    } catch (const CLI::ParseError &error) {
        return app.exit(error) == 0 ? kHealthy : kCannotRun;
    }
    if (!options.user.empty()) {
        Become(options.user);
    }
    const bool isOnTerminal = isatty(STDOUT_FILENO) == 1;
    const char *noColour = std::getenv("NO_COLOR");
    Report report({options.isJson, options.isVerbose, isOnTerminal && (noColour == nullptr || *noColour == '\0')});
    Doctor::SetTransferRules({options.timeout, isatty(STDERR_FILENO) == 1 && !options.isJson});

    return *token     ? CheckOneToken(report, options)
           : *login   ? Login(report, options)
           : *explain ? Explain(options)
                      : CheckEverything(report, options);
} catch (const std::exception &failure) {
    std::cerr << "tavosso-doctor: " << failure.what() << '\n';
    return kCannotRun;
}
