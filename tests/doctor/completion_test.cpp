#include <gmock/gmock.h>

#include <filesystem>
#include <fstream>
#include <iterator>
#include <regex>
#include <set>
#include <string>

#include "tests/doctor/doctor_process.h"
#include "tests/support/command_output.h"

// The command line in the manual page, and in the completion of bash.
namespace Test {

namespace {

using ::testing::HasSubstr;

constexpr char kCompletion[] = TAVOSSO_SOURCES "/doctor/completion.bash";
const Strings kCommands = {"token", "login", "explain"};

std::string Read(const std::string &path) {
    std::ifstream file(path);
    return {std::istreambuf_iterator<char>(file), {}};
}

/// The options that the help of a command lists.
std::set<std::string> OptionsOf(const Strings &command) {
    Strings arguments = command;
    arguments.emplace_back("--help");
    const std::string help = RunDoctor(arguments).output;
    static const std::regex option("--[a-z-]+");
    return {std::sregex_token_iterator(help.begin(), help.end(), option), std::sregex_token_iterator()};
}

/// What bash offers for the last of these words.
std::string Complete(const std::string &words) {
    const std::string script = std::string("cd " TAVOSSO_SOURCES "; source ") + kCompletion +
                               "; COMP_WORDS=(tavosso-doctor " + words +
                               "); COMP_CWORD=$((${#COMP_WORDS[@]} - 1)); _tavosso_doctor 2>/dev/null;"
                               " echo -n \"${COMPREPLY[*]}\"";
    return Test::OutputOf("bash -c '" + script + "'");
}

TEST(Options, AreDocumentedAndCompleted) {
    const std::string manual = Read(TAVOSSO_SOURCES "/docs/man/tavosso-doctor.8");
    for (const Strings &command : {Strings{}, {"token"}, {"login"}, {"explain"}}) {
        for (const std::string &option : OptionsOf(command)) {
            EXPECT_THAT(manual, HasSubstr("Fl " + option.substr(1))) << option;
            EXPECT_EQ(Complete((command.empty() ? "" : command.front() + " ") + option), option);
        }
    }
}

TEST(Commands, AreDocumentedAndCompleted) {
    const std::string help = RunDoctor({"--help"}).output;
    const std::string manual = Read(TAVOSSO_SOURCES "/docs/man/tavosso-doctor.8");
    for (const std::string &command : kCommands) {
        EXPECT_THAT(help, HasSubstr("\n  " + command + " ")) << command;
        EXPECT_THAT(manual, HasSubstr(".It Cm " + command + "\n")) << command;
        EXPECT_EQ(Complete(command), command);
    }
}

/// The sources of the doctor.
std::string Sources() {
    std::string sources;
    for (const auto &entry : std::filesystem::directory_iterator(TAVOSSO_SOURCES "/doctor")) {
        sources += Read(entry.path());
    }
    return sources;
}

TEST(Checks, InTheDocumentationExist) {
    const std::string document = Read(TAVOSSO_SOURCES "/docs/doctor.md");
    const std::string sources = Sources();
    static const std::regex id("`([a-z_]+)\\.([a-z_]+)`");
    int count = 0;
    for (std::sregex_iterator found(document.begin(), document.end(), id); found != std::sregex_iterator(); ++found) {
        const std::string group = found->str(1);
        const std::string name = found->str(2);
        // Some ids are composed of a group and a name.
        const bool isComposed =
            sources.find("." + name + '"') != std::string::npos || sources.find('"' + name + '"') != std::string::npos;
        EXPECT_TRUE(isComposed && sources.find('"' + group) != std::string::npos) << group << '.' << name;
        ++count;
    }
    EXPECT_GT(count, 60);
}

TEST(Checks, AreDocumented) {
    const std::string document = Read(TAVOSSO_SOURCES "/docs/doctor.md");
    const std::string sources = Sources();
    static const std::regex id(
        "\"(profile|client|network|discovery|keys|token_endpoint|directory|frontend|process|login|"
        "token)\\.([a-z_]+)\"");
    int count = 0;
    for (std::sregex_iterator found(sources.begin(), sources.end(), id); found != std::sregex_iterator(); ++found) {
        EXPECT_THAT(document, HasSubstr('`' + found->str(1) + '.' + found->str(2) + '`'));
        ++count;
    }
    EXPECT_GT(count, 40);
}

TEST(Completion, OffersOptionsOfCommand) {
    EXPECT_EQ(Complete("to"), "token");
    EXPECT_EQ(Complete("login --f"), "");
    EXPECT_EQ(Complete("token READ"), "README.md");
    EXPECT_EQ(Complete("--user roo"), "root");
}

}  // namespace

}  // namespace Test
