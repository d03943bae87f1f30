#include <gmock/gmock.h>
#include <termios.h>

#include <csignal>
#include <string>

#include "tests/doctor/appliance.h"
#include "tests/doctor/doctor_process.h"
#include "tests/doctor/login_dialogue.h"

// Behaviour that depends on the terminal, on a real one.
namespace Test {

namespace {

using ::testing::HasSubstr;
using ::testing::Not;

constexpr char kGreen[] = "\033[32m[ ok ]";
constexpr unsigned int kShowsInput = ECHO;

constexpr Dialogue::Over kTerminal = Dialogue::Over::kTerminal;

class Terminal : public ::testing::Test {
  protected:
    Appliance appliance{Profile::kWebSphere};
};

std::string OutputOn(Dialogue::Over over, const Strings &arguments, const Strings &variables = {}) {
    return Dialogue(over, arguments, variables).Finish().output;
}

TEST_F(Terminal, ShowsColours) { EXPECT_THAT(OutputOn(kTerminal, {}), HasSubstr(kGreen)); }

TEST_F(Terminal, HasNoColoursWithNoColorVariable) {
    EXPECT_THAT(OutputOn(kTerminal, {}, {"NO_COLOR=1"}), Not(HasSubstr("\033[32m")));
    EXPECT_THAT(OutputOn(kTerminal, {}, {"NO_COLOR="}), HasSubstr(kGreen)) << "an empty one counts as none";
}

TEST_F(Terminal, HasNoColoursIfDumb) { EXPECT_THAT(OutputOn(kTerminal, {}, {"TERM=dumb"}), Not(HasSubstr("\033"))); }

TEST_F(Terminal, WrapsLinesAtItsWidth) {
    appliance.SetClient("redirect_uri", "https://nas.example.com/");
    const std::string output = Dialogue(kTerminal, {}, {"TERM=dumb"}, {70, ""}).Finish().output;
    EXPECT_THAT(output, HasSubstr("[FAIL] websphere_redirect_uri          \"https://nas.example.com/\" is\r\n"
                                  "         not the address of the return program: its path is \"/\"\r\n"));
}

TEST_F(Terminal, PrintsJSONUnchanged) { EXPECT_THAT(OutputOn(kTerminal, {"--json"}), Not(HasSubstr("\033"))); }

TEST_F(Terminal, IsRequiredForColours) { EXPECT_THAT(OutputOn(Dialogue::Over::kPipes, {}), Not(HasSubstr("\033"))); }

TEST_F(Terminal, HidesPastedAddress) {
    Dialogue dialogue(kTerminal, {"login"});
    const unsigned int before = dialogue.FirstLocalModes();
    ASSERT_EQ(before & kShowsInput, kShowsInput);
    EXPECT_THAT(dialogue.ReadUntil("It is not shown."), HasSubstr("Paste the address here"));
    EXPECT_EQ(dialogue.LocalModes() & kShowsInput, 0U);
    dialogue.Write(kReturnURI + ("?state=not+this&code=pasted-" + std::string(20, 'x')) + "\n");
    EXPECT_THAT(dialogue.ReadUntil("finding"), Not(HasSubstr("pasted-")));
    EXPECT_EQ(dialogue.LocalModes(), before);
    EXPECT_EQ(dialogue.Finish().status, 1);
}

TEST_F(Terminal, AcceptsAddressOf6000Bytes) {
    Dialogue dialogue(kTerminal, {"login"});
    dialogue.ReadUntil("It is not shown.");
    dialogue.Write(kReturnURI + ("?code=" + std::string(6000, 'c')) + "&error=seen_to_the_end\n");
    EXPECT_THAT(dialogue.Finish().output, HasSubstr("seen_to_the_end"));
}

TEST_F(Terminal, IsRestoredAfterAbortedLogin) {
    Dialogue dialogue(kTerminal, {"login"});
    const unsigned int before = dialogue.FirstLocalModes();
    dialogue.ReadUntil("It is not shown.");
    dialogue.Write("\x03");  // Ctrl-C
    EXPECT_EQ(dialogue.WaitForEnd(), 128 + SIGINT);
    EXPECT_EQ(dialogue.LocalModes(), before);
}

TEST_F(Terminal, IsRestoredAfterSignal) {
    for (const int signal : {SIGHUP, SIGQUIT, SIGTERM}) {
        Dialogue dialogue(kTerminal, {"login"});
        const unsigned int before = dialogue.FirstLocalModes();
        dialogue.ReadUntil("It is not shown.");
        dialogue.Signal(signal);
        EXPECT_EQ(dialogue.WaitForEnd(), 128 + signal);
        EXPECT_EQ(dialogue.LocalModes(), before) << signal;
    }
}

TEST_F(Terminal, KeepsInputBeforePrompt) {
    Dialogue dialogue(kTerminal, {"login"}, {}, {0, kReturnURI + std::string("?error=typed_early\n")});
    dialogue.ReadUntil("It is not shown.");
    dialogue.Write("\n");  // ends the dialogue if the address was lost
    EXPECT_THAT(dialogue.Finish().output, HasSubstr("The provider refused: typed_early"));
}

}  // namespace

}  // namespace Test
