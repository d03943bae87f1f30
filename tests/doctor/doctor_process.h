#ifndef TAVOSSO_TESTS_DOCTOR_DOCTOR_PROCESS_H
#define TAVOSSO_TESTS_DOCTOR_DOCTOR_PROCESS_H

#include <json/json.h>
#include <sys/types.h>

#include <cstddef>
#include <string>
#include <vector>

// The built tavosso-doctor, as an administrator runs it: a process of its own, with this machine's clock.
namespace Test {

using Strings = std::vector<std::string>;

/// What a process has left behind.
struct DoctorRun {
    int status = -1;  // the signal's number and 128 where one ended it, as a shell tells it
    std::string output;
    std::string errors;
};

/// Makes it a failure of the test if any run from now on prints a piece of this text, or of its percent-encoding. A
/// piece is so many bytes that nothing else holds them by chance.
void KeepSecret(const std::string &text, std::size_t piece = 12);

/// Runs the doctor to its end, without a terminal. That it prints neither a secret nor a control character is looked at
/// here, whatever the test is about.
DoctorRun RunDoctor(const Strings &arguments, const std::string &input = "");

/// Runs the doctor as the argument of another command.
DoctorRun RunDoctorThrough(const Strings &command, const Strings &arguments = {});

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

    /// The check of this id with this mark, if there is one; else an empty one.
    Check Find(const std::string &id, const std::string &mark) const;

    /// The first finding of any id; an empty check if there is none.
    Check FirstFinding() const;

    Strings Findings() const;  // their ids
};

/// The arguments, and one more.
Strings With(Strings arguments, const std::string &more);

/// Runs the doctor for machines and for people: what the latter read is looked at as in `RunDoctor`.
Report Ask(const Strings &arguments, const std::string &input = "");

/// The one finding that there is.
Check OnlyFinding(const Strings &arguments = {});

/// For machines alone, where many are asked.
Report AskMachine(const Strings &arguments, const std::string &input = "");

/// Of a token's report the library's own word, empty where it takes the token.
std::string LibraryIn(const Report &report);

/// Of a token's report with --fetch: the steps before the library's stop are good, that one is the only finding, and
/// those behind it are not checked.
void ExpectToStopAtTheOnlyFinding(const Report &report);

/// A terminal before the doctor starts.
struct TerminalState {
    unsigned short columns = 0;  // 0: unknown
    std::string typed;
};

/// A doctor that one talks with.
class Dialogue {
  public:
    enum class Over { kPipes, kTerminal };

    /// The variables, each as NAME=VALUE, stand in its environment beside this process's own.
    Dialogue(Over over, const Strings &arguments, const Strings &variables = {}, const TerminalState &state = {});
    ~Dialogue();
    Dialogue(const Dialogue &) = delete;
    Dialogue &operator=(const Dialogue &) = delete;

    /// Waits until it has printed this, or has ended. Gives all that it has printed so far.
    std::string ReadUntil(const std::string &text);

    void Write(const std::string &bytes) const;

    /// Nothing more will be written. Waits for its end.
    DoctorRun Finish();

    void Signal(int signal) const;

    /// Its status, as long as the terminal is still there to look at.
    int WaitForEnd();

    /// Of the terminal, in the kernel's bits; and what they were before the doctor began.
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
