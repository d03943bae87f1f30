// tavosso-doctor: finds out why logins fail.
#include <grp.h>
#include <pwd.h>
#include <sys/ioctl.h>
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

// More than any provider sends. Bounds the memory for a wrong file.
constexpr std::size_t kLongestToken = std::size_t{1} << 20;

/// The command line.
struct Options {
    bool isJson = false;
    bool isVerbose = false;
    bool isQuiet = false;
    std::string profile;
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

constexpr char kExamples[] = R"(Examples:
  sudo tavosso-doctor                              check everything
  sudo tavosso-doctor --domain alice@corp.example.net
                                                   also print the name that this user gets
  sudo tavosso-doctor --profile azure              check a profile before it is switched on
  sudo tavosso-doctor --user www-data              check with the rights of this user
  sudo tavosso-doctor login                        walk through a login
  tavosso-doctor explain "id_token expired."       explain a text)";

/// The command cannot run.
class cannot_run : public std::runtime_error {
  public:
    using std::runtime_error::runtime_error;
};

/// Takes the ids of a user for good.
void Become(const std::string &name) {
    const passwd *user = getpwnam(name.c_str());
    if (user == nullptr) {
        throw cannot_run("there is no user " + name);
    }
    if (initgroups(user->pw_name, user->pw_gid) != 0 || setresgid(user->pw_gid, user->pw_gid, user->pw_gid) != 0 ||
        setresuid(user->pw_uid, user->pw_uid, user->pw_uid) != 0) {
        throw cannot_run("--user needs root. Run: sudo tavosso-doctor --user " + name);
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
        throw cannot_run("this is not a token: it is longer than 1 MiB");
    }
    return boost::trim_copy(token);
}

std::string Variable(const char *name) {
    const char *value = std::getenv(name);
    return value != nullptr ? value : "";
}

bool IsDumb() { return Variable("TERM") == "dumb"; }

bool HasColours() { return isatty(STDOUT_FILENO) == 1 && Variable("NO_COLOR").empty() && !IsDumb(); }

/// Returns 0 if standard output is not a terminal.
std::size_t WidthOfTerminal() {
    winsize size{};
    return ioctl(STDOUT_FILENO, TIOCGWINSZ, &size) == 0 ? size.ws_col : 0;
}

int StatusOf(const Report &report) { return report.HasFindings() ? kFindings : kHealthy; }

Doctor::RunAs RunAsOf(const Options &options) {
    return !options.user.empty() ? Doctor::RunAs::kChosenUser
           : geteuid() == 0      ? Doctor::RunAs::kRoot
                                 : Doctor::RunAs::kOrdinaryUser;
}

/// Returns the configured profile, or that of --profile.
std::optional<Profile> FindProfile(Report &report, const Options &options) {
    if (options.profile.empty()) {
        return Doctor::CheckProfile(report, RunAsOf(options));
    }
    report.Section("Profile");
    report.NotChecked("profile.file", "profile", "--profile selects " + options.profile);
    return Doctor::ProfileNamed(options.profile);
}

constexpr char kOtherEnvironment[] =
    "that the programs of the web server have the rights and the environment of this command. If they run as another "
    "user, add: --user NAME. Their proxy is in the web server's settings (lighttpd: setenv.add-environment).";

int CheckEverything(Report &report, const Options &options) {
    const Doctor::RunAs runAs = RunAsOf(options);
    if (runAs == Doctor::RunAs::kOrdinaryUser) {
        report.Section("User");
        report.Finding("process.user", "user", "not root. Run with sudo: only root can read the client's file",
                       "Run: sudo tavosso-doctor");
    }
    if (const std::optional<Profile> profile = FindProfile(report, options)) {
        Doctor::TakeLogLines();
        Client client(*profile);
        Doctor::CheckClientFile(report, client, options.returnProgram, runAs);
        Doctor::CheckProvider(report, client);
        if (*profile == Profile::kAzure) {
            Doctor::CheckDirectory(report, options.domain, runAs);
        }
        Doctor::CheckFrontEnd(report, client, options.returnProgram, runAs);
    }
    report.Unproved("that a user can sign in");
    report.Unproved(kOtherEnvironment);
    report.Finish("check", "Next step: sudo tavosso-doctor login");
    return StatusOf(report);
}

/// Returns the client of the configured profile, or of --profile.
Client RequireClient(Report &report, const Options &options) {
    Report unprinted({});
    const std::optional<Profile> profile = FindProfile(unprinted, options);
    if (!profile) {
        throw cannot_run("no profile is configured. For the cause, run: sudo tavosso-doctor");
    }
    Client client(*profile);
    Doctor::HideSecrets(report, client);
    return client;
}

int CheckOneToken(Report &report, const Options &options) {
    Client client = RequireClient(report, options);
    Json::Value more;
    more["stops_at"] = Doctor::CheckToken(report, client, ReadToken(options.tokenFile), options.mayFetch);
    report.Finish("token", "", more);
    return StatusOf(report);
}

int Login(Report &report, const Options &options) {
    if (options.isJson) {
        throw cannot_run("login is a dialogue. Remove --json");
    }
    Client client = RequireClient(report, options);
    if (!Doctor::MayPrintClientID(client)) {
        throw cannot_run("azure_client_id is not a GUID. Run: sudo tavosso-doctor");
    }
    if (!options.redirectURI.empty()) {
        client->SetRedirectURI(options.redirectURI);
    }
    if (!Doctor::WalkLogin(report, client)) {
        throw cannot_run("no address was given");
    }
    report.Unproved(kOtherEnvironment);
    report.Finish("login",
                  "If users still cannot sign in, run: journalctl -t login.cgi -t return.cgi -p warning. Then run: "
                  R"(tavosso-doctor explain "LINE")");
    return StatusOf(report);
}

int Explain(const Options &options) {
    if (options.isList != options.words.empty()) {
        throw cannot_run("explain needs either a text or --list");
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
        std::cout << "Unknown text. Use a whole line of the log, or the text of an exception.\n";
    } else {
        Doctor::PrintExplanations(explanations);
    }
    return explanations.empty() ? kFindings : kHealthy;
}

}  // namespace

int main(int argc, char **argv) try {
    Options options;
    CLI::App app("Finds out why users cannot sign in, and prints a remedy for each finding.", "tavosso-doctor");
    app.set_version_flag("--version", "tavosso-doctor " TAVOSSO_VERSION);
    CLI::Option *json = app.add_flag("--json", options.isJson, "Write one JSON object");
    CLI::Option *verbose =
        app.add_flag("--verbose", options.isVerbose, "Print all checks, and the library's requests and log lines");
    app.add_flag("--quiet", options.isQuiet, "Print findings only")->excludes(verbose)->excludes(json);
    app.add_option("--timeout", options.timeout, "Seconds to wait for each response of the provider")
        ->check(CLI::Range(1L, 3600L))
        ->capture_default_str();
    app.add_option("--user", options.user, "Run with the rights of a program that this user starts");
    app.add_option("--profile", options.profile, "Check this profile, whether or not it is switched on")
        ->check(CLI::IsMember({"azure", "websphere"}));
    app.add_option("--domain", options.domain, "Convert this domain, or the name of this user (USER@DOMAIN)");
    app.add_option("--return-program", options.returnProgram, "The path in the redirect URI")->capture_default_str();
    app.require_subcommand(0, 1);
    app.fallthrough();

    CLI::App *token = app.add_subcommand("token", "Verify an ID token step by step");
    token->add_option("FILE", options.tokenFile, "A file with the token, or - for standard input")->required();
    token->add_flag("--fetch", options.mayFetch, "Fetch the provider's keys");

    CLI::App *login = app.add_subcommand("login", "Walk through a login in the terminal");
    login->add_option("--redirect-uri", options.redirectURI, "Another redirect URI that is registered at the provider");

    CLI::App *explain = app.add_subcommand("explain", "Explain an exception, an error code or a line of the log");
    explain->add_option("TEXT", options.words, "The text");
    CLI::Option *list = explain->add_flag("--list", options.isList, "Print all texts that it explains");
    explain->add_flag("--markdown", options.isMarkdown, "Print them as the tables of the documentation")->needs(list);

    try {
        app.parse(argc, argv);
    } catch (const CLI::CallForHelp &) {
        // Newer versions of CLI11 would wrap a footer.
        std::cout << app.help() << kExamples << '\n';
        return kHealthy;
    } catch (const CLI::ParseError &error) {
        return app.exit(error) == 0 ? kHealthy : kCannotRun;
    }
    if (!options.user.empty()) {
        Become(options.user);
    }
    Report report({options.isJson, options.isVerbose, options.isQuiet, HasColours(), WidthOfTerminal()});
    const bool showsProgress = isatty(STDERR_FILENO) == 1 && !IsDumb() && !options.isJson && !options.isQuiet;
    Doctor::SetTransferRules({options.timeout, showsProgress});

    return *token     ? CheckOneToken(report, options)
           : *login   ? Login(report, options)
           : *explain ? Explain(options)
                      : CheckEverything(report, options);
} catch (const std::exception &failure) {
    std::cerr << "tavosso-doctor: " << failure.what() << '\n';
    return kCannotRun;
}
