#include "tests/doctor/doctor_process.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <pty.h>
#include <spawn.h>
#include <sys/mman.h>
#include <sys/wait.h>
#include <termios.h>
#include <unistd.h>

#include <algorithm>
#include <boost/algorithm/string/predicate.hpp>
#include <cerrno>
#include <csignal>
#include <fstream>
#include <iterator>
#include <memory>
#include <stdexcept>
#include <utility>

#include "sso/sso.h"
#include "tests/support/token.h"

namespace Test {

namespace {

struct Secret {
    std::string text;
    std::size_t piece;
};

std::vector<Secret> secrets;

void Require(bool condition, const char *what) {
    if (!condition) {
        throw std::runtime_error(what);
    }
}

/// An unnamed file.
int MakeFile(const std::string &content = "") {
    const int file = memfd_create("doctor", MFD_CLOEXEC);
    Require(file >= 0 && write(file, content.data(), content.size()) == static_cast<ssize_t>(content.size()) &&
                lseek(file, 0, SEEK_SET) == 0,
            "memfd_create");
    return file;
}

/// Reads the rest and closes the file. Reading a terminal that no process has open any more fails.
std::string ReadAll(int file) {
    std::string content;
    char bytes[4096];
    for (ssize_t count = 0; (count = read(file, bytes, sizeof bytes)) > 0;) {
        content.append(bytes, static_cast<std::size_t>(count));
    }
    close(file);
    return content;
}

std::string ReadFile(int file) {
    lseek(file, 0, SEEK_SET);
    return ReadAll(file);
}

/// How a process is started.
class Start {
  public:
    Start() {
        posix_spawn_file_actions_init(&actions_);
        posix_spawnattr_init(&attributes_);
    }
    ~Start() {
        posix_spawn_file_actions_destroy(&actions_);
        posix_spawnattr_destroy(&attributes_);
    }
    Start(const Start &) = delete;
    Start &operator=(const Start &) = delete;

    void Give(int file, int as) { posix_spawn_file_actions_adddup2(&actions_, file, as); }

    /// As the leader of a new session with this controlling terminal.
    void GiveTerminal(const char *path) {
        posix_spawnattr_setflags(&attributes_, POSIX_SPAWN_SETSID);
        posix_spawn_file_actions_addopen(&actions_, STDIN_FILENO, path, O_RDWR, 0);
        Give(STDIN_FILENO, STDOUT_FILENO);
        Give(STDIN_FILENO, STDERR_FILENO);
    }

    pid_t Doctor(const Strings &arguments, const Strings &variables) {
        Strings words{TAVOSSO_DOCTOR};
        words.insert(words.end(), arguments.begin(), arguments.end());
        return Command(words, variables);
    }

    pid_t Command(Strings words, const Strings &variables) {
        Strings environment = EnvironmentWith(variables);
        pid_t process = -1;
        Require(posix_spawn(&process, words.front().c_str(), &actions_, &attributes_, Pointers(words).data(),
                            Pointers(environment).data()) == 0,
                "posix_spawn");
        return process;
    }

  private:
    /// This process's environment with these variables, each name once: of two values, libc reads the first, and
    /// qemu-user passes on the last.
    static Strings EnvironmentWith(const Strings &variables) {
        Strings environment = variables;
        for (char **variable = environ; *variable != nullptr; ++variable) {
            const std::string text = *variable;
            const std::string assignment = text.substr(0, text.find('=') + 1);
            if (std::none_of(variables.begin(), variables.end(),
                             [&](const std::string &other) { return boost::starts_with(other, assignment); })) {
                environment.push_back(text);
            }
        }
        return environment;
    }

    static std::vector<char *> Pointers(Strings &texts) {
        std::vector<char *> pointers;
        for (std::string &text : texts) {
            pointers.push_back(text.data());
        }
        pointers.push_back(nullptr);
        return pointers;
    }

    posix_spawn_file_actions_t actions_{};
    posix_spawnattr_t attributes_{};
};

int WaitFor(pid_t process) {
    int status = 0;
    Require(waitpid(process, &status, 0) == process, "waitpid");
    return WIFSIGNALED(status) ? 128 + WTERMSIG(status) : WEXITSTATUS(status);
}

/// Reports a secret by its number, to keep it out of the test's output.
void ExpectNoSecret(const std::string &text) {
    for (std::size_t i = 0; i < secrets.size(); ++i) {
        const auto &[secret, piece] = secrets[i];
        for (std::size_t begin = 0; begin + piece <= secret.size(); ++begin) {
            if (text.find(secret.substr(begin, piece)) != std::string::npos) {
                ADD_FAILURE() << "secret " << i << " is in the output, from its byte " << begin << " on";
                break;
            }
        }
    }
}

/// A control character of ASCII or C1, in UTF-8 or as a single byte. Terminals may interpret each.
bool HoldsControl(const std::string &text) {
    const auto byteAt = [&](std::size_t i) { return static_cast<unsigned char>(text[i]); };
    for (std::size_t i = 0; i < text.size(); ++i) {
        const bool isC1 = byteAt(i) >= 0x80 && byteAt(i) < 0xa0;
        const bool isAlone = i == 0 || byteAt(i - 1) < 0x80 || byteAt(i - 1) == 0xc2;
        if ((byteAt(i) < 0x20 && text[i] != '\n') || text[i] == 0x7f || (isC1 && isAlone)) {
            return true;
        }
    }
    return false;
}

void ExpectHarmless(const DoctorRun &run) {
    for (const std::string &text : {run.output, run.errors}) {
        ExpectNoSecret(text);
        EXPECT_FALSE(HoldsControl(text)) << "control characters in the output";
    }
    EXPECT_LT(run.status, 128) << "a signal has ended it: " << run.errors;
}

void ExpectDocumented(const std::vector<Check> &checks) {
    std::ifstream file(TAVOSSO_SOURCES "/docs/doctor.md");
    const std::string chapter{std::istreambuf_iterator<char>(file), {}};
    for (const Check &check : checks) {
        EXPECT_NE(chapter.find('`' + check.id + '`'), std::string::npos) << check.id << " is not in the chapter";
    }
}

/// Checks before the library's stop are good, later ones are not checked.
void ExpectInOrder(const Report &report, const std::string &stop) {
    bool isBehind = false;
    for (const Check &check : report.checks) {
        const bool isStop = check.id == stop;
        EXPECT_EQ(check.mark, isStop ? "finding" : isBehind ? "not checked" : "good") << check.id;
        isBehind = isBehind || isStop;
    }
}

}  // namespace

Strings With(Strings arguments, const std::string &more) {
    arguments.push_back(more);
    return arguments;
}

void KeepSecret(const std::string &text, std::size_t piece) {
    for (const std::string &form : {text, TAVO::SSO::URLEncode(text)}) {
        const auto isForm = [&](const Secret &other) { return other.text == form; };
        if (std::none_of(secrets.begin(), secrets.end(), isForm)) {
            secrets.push_back({form, piece});
        }
    }
}

DoctorRun RunDoctor(const Strings &arguments, const std::string &input, const Strings &through) {
    Strings words = With(through, TAVOSSO_DOCTOR);
    words.insert(words.end(), arguments.begin(), arguments.end());
    const int in = MakeFile(input);
    const int out = MakeFile();
    const int errors = MakeFile();
    Start start;
    start.Give(in, STDIN_FILENO);
    start.Give(out, STDOUT_FILENO);
    start.Give(errors, STDERR_FILENO);
    DoctorRun run;
    run.status = WaitFor(start.Command(words, {}));
    close(in);
    run.output = ReadFile(out);
    run.errors = ReadFile(errors);
    ExpectHarmless(run);
    return run;
}

Check Report::Find(const std::string &id, const std::string &mark) const {
    const auto check = std::find_if(checks.begin(), checks.end(),
                                    [&](const Check &other) { return other.id == id && other.mark == mark; });
    return check != checks.end() ? *check : Check{};
}

Check Report::FirstFinding() const {
    const auto check =
        std::find_if(checks.begin(), checks.end(), [](const Check &other) { return other.mark == "finding"; });
    return check != checks.end() ? *check : Check{};
}

Strings Report::Findings() const {
    Strings ids;
    for (const Check &check : checks) {
        if (check.mark == "finding") {
            ids.push_back(check.id);
        }
    }
    return ids;
}

Report Ask(const Strings &arguments, const std::string &input) {
    const DoctorRun forPeople = RunDoctor(With(arguments, "--verbose"), input);
    const Report report = AskMachine(arguments, input);
    EXPECT_EQ(forPeople.status, report.status);
    return report;
}

Check OnlyFinding(const Strings &arguments) {
    const Report report = Ask(arguments);
    EXPECT_EQ(report.Findings().size(), 1U) << ::testing::PrintToString(report.Findings());
    return report.FirstFinding();
}

Report AskMachine(const Strings &arguments, const std::string &input, const Strings &through) {
    const DoctorRun run = RunDoctor(With(arguments, "--json"), input, through);
    EXPECT_EQ(run.errors, "");
    Report report;
    report.status = run.status;
    report.json = Parse(run.output);
    for (const Json::Value &check : report.json["checks"]) {
        report.checks.push_back({check["id"].asString(), check["mark"].asString(), check["subject"].asString(),
                                 check["found"].asString(), check["remedy"].asString(), check["library"].asString()});
    }
    EXPECT_FALSE(report.checks.empty()) << "nothing was looked at";
    ExpectDocumented(report.checks);
    EXPECT_EQ(report.json["healthy"].asBool(), report.Findings().empty());
    EXPECT_EQ(report.status, report.Findings().empty() ? 0 : 1);
    return report;
}

std::string LibraryIn(const Report &report) {
    std::string library;
    for (const Check &check : report.checks) {
        library += check.library;
    }
    return library;
}

void ExpectToStopAtTheOnlyFinding(const Report &report) {
    const std::string stop = report.json["stops_at"].asString();
    EXPECT_EQ(report.Findings(), stop.empty() ? Strings() : Strings{stop});
    ExpectInOrder(report, stop);
    EXPECT_EQ(LibraryIn(report), report.Find(stop, "finding").library);
    EXPECT_EQ(LibraryIn(report).empty(), stop.empty());
}

Dialogue::Dialogue(Over over, const Strings &arguments, const Strings &variables, const TerminalState &state) {
    Start start;
    if (over == Over::kTerminal) {
        int terminal = -1;
        char path[64];
        const winsize size{24, state.columns, 0, 0};
        Require(openpty(&output_, &terminal, path, nullptr, &size) == 0, "openpty");
        fcntl(output_, F_SETFD, FD_CLOEXEC);
        firstLocalModes_ = LocalModes();
        input_ = fcntl(output_, F_DUPFD_CLOEXEC, 0);
        Write(state.typed);
        start.GiveTerminal(path);
        process_ = start.Doctor(arguments, variables);
        close(terminal);
        return;
    }
    int in[2];
    int out[2];
    Require(pipe2(in, O_CLOEXEC) == 0 && pipe2(out, O_CLOEXEC) == 0, "pipe2");
    errors_ = MakeFile();
    start.Give(in[0], STDIN_FILENO);
    start.Give(out[1], STDOUT_FILENO);
    start.Give(errors_, STDERR_FILENO);
    process_ = start.Doctor(arguments, variables);
    close(in[0]);
    close(out[1]);
    input_ = in[1];
    output_ = out[0];
}

Dialogue::~Dialogue() {
    if (process_ > 0) {
        kill(process_, SIGKILL);
        Finish();
    }
}

std::string Dialogue::ReadUntil(const std::string &text) {
    char bytes[4096];
    while (printed_.find(text) == std::string::npos) {
        const ssize_t count = read(output_, bytes, sizeof bytes);
        if (count <= 0) {
            break;
        }
        printed_.append(bytes, static_cast<std::size_t>(count));
    }
    return printed_;
}

void Dialogue::Write(const std::string &bytes) const {
    std::size_t written = 0;
    while (written < bytes.size()) {
        const ssize_t count = write(input_, bytes.data() + written, bytes.size() - written);
        Require(count > 0, "write to the doctor");
        written += static_cast<std::size_t>(count);
    }
}

void Dialogue::CloseInput() { close(std::exchange(input_, -1)); }

DoctorRun Dialogue::Finish() {
    CloseInput();
    DoctorRun run;
    run.output = printed_ + ReadAll(output_);
    run.status = process_ > 0 ? WaitForEnd() : -1;
    if (errors_ >= 0) {
        run.errors = ReadFile(errors_);
        ExpectHarmless(run);
    } else {
        ExpectNoSecret(run.output);
    }
    return run;
}

void Dialogue::Signal(int signal) const { kill(process_, signal); }

int Dialogue::WaitForEnd() { return WaitFor(std::exchange(process_, -1)); }

unsigned int Dialogue::LocalModes() const {
    termios modes{};
    Require(tcgetattr(output_, &modes) == 0, "tcgetattr");
    return modes.c_lflag;
}

}  // namespace Test
