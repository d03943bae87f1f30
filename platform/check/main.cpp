// tavosso-platform-check: verifies that libraries keep the promises of platform/platform.h.
#include <CLI/CLI.hpp>
#include <chrono>
#include <iostream>
#include <optional>
#include <stdexcept>
#include <string>
#include <vector>

#include "platform/check/child_process.h"
#include "platform/check/promise.h"

namespace {

using PlatformCheck::Conversion;
using PlatformCheck::Promise;
using PlatformCheck::Result;
using PlatformCheck::Subject;

enum ExitStatus { kAllKept = 0, kBroken = 1, kCannotRun = 2 };

/// The command line.
struct Options {
    std::vector<std::string> libraries = {"libtavosso.so.6"};  // is linked to the platform
    std::optional<std::string> lookup;
    long timeout = 10;
};

constexpr char kExamples[] = R"(Examples:
  tavosso-platform-check                           check the platform of libtavosso.so.6
  tavosso-platform-check ./libtavoplatform.so.0    check this library
  tavosso-platform-check --lookup 'CORP.EXAMPLE.NET\alice=CORP\alice'
                                                   also check the conversion of this name)";

/// Reads NAME=RESULT. Throws if it is something else.
Conversion ReadConversion(const std::string &lookup) {
    const std::size_t end = lookup.find('=');
    if (end == std::string::npos) {
        throw std::invalid_argument(R"(--lookup must be DNSNAME\USER=NETBIOSNAME\USER)");
    }
    Conversion conversion = {lookup.substr(0, end), lookup.substr(end + 1)};
    for (const std::string &name : {conversion.name, conversion.result}) {
        const std::size_t backslash = name.find('\\');
        if (backslash == 0 || backslash == std::string::npos || backslash + 1 == name.size()) {
            throw std::invalid_argument(R"(--lookup must be DNSNAME\USER=NETBIOSNAME\USER)");
        }
    }
    return conversion;
}

std::vector<Promise> AllPromises() {
    std::vector<Promise> promises;
    for (const auto &group : {PlatformCheck::URLEncodingPromises(), PlatformCheck::Base64EncodingPromises(),
                              PlatformCheck::Base64DecodingPromises(), PlatformCheck::LookupPromises()}) {
        promises.insert(promises.end(), group.begin(), group.end());
    }
    return promises;
}

/// Calls the functions. An exception of theirs breaks the promise.
void Verify(const Promise &promise, const Subject &subject) {
    try {
        promise.verify(subject);
    } catch (const PlatformCheck::promise_broken &) {
        throw;
    } catch (const std::exception &exception) {
        throw PlatformCheck::promise_broken(std::string("an exception leaves the function: ") +
                                            PlatformCheck::Quoted(exception.what()));
    }
}

/// Loads the libraries on trial: their initialisation may crash.
void RequireLoadable(const Options &options) {
    const Result result = PlatformCheck::RunInChild([&] { PlatformCheck::LoadPlatform(options.libraries); },
                                                    std::chrono::seconds(options.timeout));
    if (!result.isGood) {
        throw std::runtime_error("the platform cannot be loaded: " + result.reason);
    }
}

/// Each promise has its own process, which loads the libraries, as a program of the web server does.
Result VerifyInChild(const Promise &promise, const Options &options, const std::optional<Conversion> &conversion) {
    const auto task = [&] { Verify(promise, {PlatformCheck::LoadPlatform(options.libraries), conversion}); };
    return PlatformCheck::RunInChild(task, std::chrono::seconds(options.timeout));
}

void Print(const char *mark, const Promise &promise, const std::string &reason) {
    std::cout << mark << promise.function << ": " << promise.behaviour << (reason.empty() ? "" : ": ") << reason
              << std::endl;
}

int CheckAll(const Options &options) {
    std::optional<Conversion> conversion;
    if (options.lookup) {
        conversion = ReadConversion(*options.lookup);
    }
    RequireLoadable(options);
    int kept = 0;
    int broken = 0;
    int skipped = 0;
    for (const Promise &promise : AllPromises()) {
        if (promise.needsConversion && !conversion) {
            Print("skipped ", promise, "needs --lookup with a name that the platform knows");
            ++skipped;
            continue;
        }
        const Result result = VerifyInChild(promise, options, conversion);
        Print(result.isGood ? "ok      " : "BROKEN  ", promise, result.reason);
        ++(result.isGood ? kept : broken);
    }
    std::cout << kept + broken + skipped << " promises: " << kept << " kept, " << broken << " broken, " << skipped
              << " skipped\n";
    return broken == 0 ? kAllKept : kBroken;
}

}  // namespace

int main(int argc, char **argv) try {
    Options options;
    CLI::App app("Checks whether libraries keep the promises of platform/platform.h.", "tavosso-platform-check");
    app.set_version_flag("--version", "tavosso-platform-check " TAVOSSO_VERSION);
    app.add_option("LIBRARY", options.libraries, "Libraries that define the functions, or are linked to them")
        ->capture_default_str();
    app.add_option("--lookup", options.lookup, "A name that the platform knows, and its conversion: NAME=RESULT");
    app.add_option("--timeout", options.timeout, "Seconds to wait for each call")
        ->check(CLI::Range(1L, 3600L))
        ->capture_default_str();
    try {
        app.parse(argc, argv);
    } catch (const CLI::CallForHelp &) {
        // Newer versions of CLI11 would wrap a footer.
        std::cout << app.help() << kExamples << '\n';
        return kAllKept;
    } catch (const CLI::ParseError &error) {
        return app.exit(error) == 0 ? kAllKept : kCannotRun;
    }
    return CheckAll(options);
} catch (const std::exception &failure) {
    std::cerr << "tavosso-platform-check: " << failure.what() << '\n';
    return kCannotRun;
}
