#ifndef TAVOSSO_TESTS_DOCTOR_DOCTOR_PROCESS_H
#define TAVOSSO_TESTS_DOCTOR_DOCTOR_PROCESS_H

#include <json/json.h>
#include <sys/types.h>

#include <cstddef>
#include <string>
#include <vector>

// Runs the built tavosso-doctor as a separate process with this machine's clock.
namespace Test {

using Strings = std::vector<std::string>;

/// Output and status of a process.
struct DoctorRun {
    int status = -1;  // 128 and the signal's number if a signal ended it
    std::string output;
    std::string errors;
};

/// Fails the test if a later run prints a piece of this text or of its percent-encoding. Pieces are too long to occur
/// by chance.
void KeepSecret(const std::string &text, std::size_t piece = 12);

/// Runs the doctor without a terminal, perhaps through another command. Fails the test if it prints a secret or a
/// control character.
DoctorRun RunDoctor(const Strings &arguments, const std::string &input = "", const Strings &through = {});

/// One check of a report.
struct Check {
    std::string id;
    std::string mark;
    std::string subject;
    std::string found;
    std::string remedy;
    std::string library;
};

struct Report {
    int status = -1;
    Json::Value json;
    std::vector<Check> checks;

    /// Returns the check with this id and mark, or an empty one.
    Check Find(const std::string &id, const std::string &mark) const;

    /// Returns the first finding, or an empty check.
    Check FirstFinding() const;

    Strings Findings() const;  // their ids
};

/// Appends an argument.
Strings With(Strings arguments, const std::string &more);

/// Runs the doctor with --json and without. Verifies both outputs like `RunDoctor`.
Report Ask(const Strings &arguments, const std::string &input = "");

/// Returns the only finding.
Check OnlyFinding(const Strings &arguments = {});

/// Runs the doctor only with --json, for tests with many runs.
Report AskMachine(const Strings &arguments, const std::string &input = "", const Strings &through = {});

/// Returns the library's text in the report of a token. Empty if the library accepts it.
std::string LibraryIn(const Report &report);

/// Verifies a token's report with --fetch: steps before the library's stop are good, that step is the only finding, and
/// later ones are not checked.
void ExpectToStopAtTheOnlyFinding(const Report &report);

/// The state of a terminal before the doctor starts.
struct TerminalState {
    unsigned short columns = 0;  // 0: unknown
    std::string typed;
};

/// A running doctor on a terminal.
class Dialogue {
  public:
    enum class Over { kPipes, kTerminal };

    /// Adds the variables, each as NAME=VALUE, to this process's environment.
    Dialogue(Over over, const Strings &arguments, const Strings &variables = {}, const TerminalState &state = {});
    ~Dialogue();
    Dialogue(const Dialogue &) = delete;
    Dialogue &operator=(const Dialogue &) = delete;

    /// Waits until it has printed this or has ended. Returns its output so far.
    std::string ReadUntil(const std::string &text);

    void Write(const std::string &bytes) const;

    /// Closes its input and waits for its end.
    DoctorRun Finish();

    void Signal(int signal) const;

    /// Returns its status while the terminal still exists.
    int WaitForEnd();

    /// The terminal's local modes, now and before the doctor started.
    unsigned int LocalModes() const;
    unsigned int FirstLocalModes() const { return firstLocalModes_; }

  private:
    void CloseInput();

    pid_t process_ = -1;
    int input_ = -1;
    int output_ = -1;
    int errors_ = -1;
    unsigned int firstLocalModes_ = 0;
    std::string printed_;
};

}  // namespace Test

#endif
