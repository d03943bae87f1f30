#ifndef TAVOSSO_TESTS_DOCTOR_LOGIN_DIALOGUE_H
#define TAVOSSO_TESTS_DOCTOR_LOGIN_DIALOGUE_H

#include <string>

#include "tests/doctor/doctor_process.h"

// `tavosso-doctor login` with a simulated user.
namespace Test {

constexpr char kEndOfPrompt[] = "It is not shown.\n";

class LoginDialogue {
  public:
    /// Reads the address for the browser.
    explicit LoginDialogue(const Strings &arguments = {"login"});

    /// Returns a parameter of that address, percent-encoded.
    std::string Parameter(const std::string &name) const;

    /// The return address for a known user.
    std::string ReturnAddress(const std::string &code) const;

    /// Pastes the address. The report's checks have subjects but no ids.
    Report Paste(const std::string &address);

  private:
    Dialogue dialogue_;
    std::string address_;
};

/// Runs a login of a known user.
Report WalkLogin();

}  // namespace Test

#endif
