#ifndef TAVOSSO_TESTS_DOCTOR_LOGIN_DIALOGUE_H
#define TAVOSSO_TESTS_DOCTOR_LOGIN_DIALOGUE_H

#include <string>

#include "tests/doctor/doctor_process.h"

// `tavosso-doctor login`, and the person at the terminal with a browser.
namespace Test {

constexpr char kEndOfPrompt[] = "It is not shown.\n";

class LoginDialogue {
  public:
    /// Reads the address that the browser is to open.
    explicit LoginDialogue(const Strings &arguments = {"login"});

    /// A parameter of that address, in percent-encoding.
    std::string Parameter(const std::string &name) const;

    /// Where a provider sends the browser to that knows the user.
    std::string ReturnAddress(const std::string &code) const;

    /// Pastes the address. The checks of the report have subjects, and no ids.
    Report Paste(const std::string &address);

  private:
    Dialogue dialogue_;
    std::string address_;
};

/// A login whose user the provider knows.
Report WalkLogin();

}  // namespace Test

#endif
