#include "platform/standin/winbind.h"

#include <fcntl.h>
#include <sys/wait.h>
#include <unistd.h>

#include <array>
#include <boost/algorithm/string/predicate.hpp>
#include <cerrno>
#include <climits>
#include <csignal>
#include <cstdint>
#include <cstring>
#include <locale>
#include <memory>
#include <optional>
#include <system_error>

// A C header that does not include the standard types.
extern "C" {
#include <wbclient.h>
}

namespace TAVO::Platform {

namespace {

using Kind = WinbindAnswer::Kind;

constexpr unsigned int kPatience = 1;  // seconds

/// The answer of the child. A pipe transfers up to PIPE_BUF bytes at once.
struct Message {
    wbcErr error;
    std::array<char, 256> dnsName;  // winbindd's own limit
    std::array<char, 256> netBIOSName;
};
static_assert(sizeof(Message) <= PIPE_BUF);

/// One end of a pipe.
class Descriptor {
  public:
    explicit Descriptor(int number) : number_(number) {}
    ~Descriptor() { close(number_); }
    Descriptor(const Descriptor &) = delete;
    Descriptor &operator=(const Descriptor &) = delete;

    int Number() const { return number_; }

  private:
    int number_;
};

/// Leaves the copy empty if the text is null or too long.
void Copy(const char *text, std::array<char, 256> &copy) {
    if (text != nullptr && std::strlen(text) < copy.size()) {
        std::memcpy(copy.data(), text, std::strlen(text));
    }
}

Message Ask(const char *domain) {
    Message message{};
    struct wbcDomainInfo *information = nullptr;  // `struct`: a function has the same name
    message.error = ::wbcDomainInfo(domain, &information);
    const std::unique_ptr<struct wbcDomainInfo, decltype(&wbcFreeMemory)> owner(information, wbcFreeMemory);
    if (message.error == WBC_ERR_SUCCESS) {
        Copy(information->dns_name, message.dnsName);
        Copy(information->short_name, message.netBIOSName);
    }
    return message;
}

/// Runs the child process. An alarm ends it, because libwbclient waits for minutes and cannot be given a time limit.
/// SIGALRM is reset and unblocked first, because the program may have handled or blocked it.
[[noreturn]] void AskInChild(const char *domain, int out) {
    std::signal(SIGALRM, SIG_DFL);
    sigset_t signals;
    sigemptyset(&signals);
    sigaddset(&signals, SIGALRM);
    sigprocmask(SIG_UNBLOCK, &signals, nullptr);
    alarm(kPatience);
    // libwbclient reads settings from the environment, which is untrusted in a process with raised ids.
    environ = nullptr;
    const Message message = Ask(domain);
    // _exit does not flush the program's buffers or run its exit handlers.
    _exit(write(out, &message, sizeof message) == sizeof message ? 0 : 1);
}

/// Waits until the child has ended. Other code of the program may reap it first.
void WaitForEnd(pid_t child) {
    while (waitpid(child, nullptr, 0) < 0 && errno == EINTR) {
    }
}

/// Reads the answer of the child, which has ended. The pipe is non-blocking, because another child of the program may
/// hold its other end open.
std::optional<Message> Receive(int in) {
    Message message{};
    return read(in, &message, sizeof message) == sizeof message ? std::optional(message) : std::nullopt;
}

WinbindAnswer NotAsked(int error) { return {Kind::kNotAsked, std::generic_category().message(error)}; }

WinbindAnswer Judge(const Message &message, const std::string &domain) {
    switch (message.error) {
        case WBC_ERR_SUCCESS:
            break;
        case WBC_ERR_DOMAIN_NOT_FOUND:
            return {Kind::kUnknown, ""};
        case WBC_ERR_WINBIND_NOT_AVAILABLE:
            return {Kind::kNotAvailable, ""};
        default:
            return {Kind::kNotAsked, wbcErrorString(message.error)};
    }
    // winbindd also answers for NetBIOS names and for the machine's own names. The provider chooses the text after the
    // at sign and must not be able to name local accounts.
    const std::string netBIOSName = message.netBIOSName.data();
    if (netBIOSName.empty() || !boost::iequals(message.dnsName.data(), domain, std::locale::classic())) {
        return {Kind::kUnknown, ""};
    }
    return {Kind::kKnown, netBIOSName};
}

}  // namespace

WinbindAnswer AskWinbind(const std::string &domain) {
    if (domain.empty()) {
        return {Kind::kUnknown, ""};
    }
    std::array<int, 2> ends{};
    if (pipe2(ends.data(), O_CLOEXEC | O_NONBLOCK) != 0) {
        return NotAsked(errno);
    }
    const Descriptor in(ends[0]);
    const Descriptor out(ends[1]);
    const pid_t child = fork();
    if (child < 0) {
        return NotAsked(errno);
    }
    if (child == 0) {
        AskInChild(domain.c_str(), out.Number());
    }
    WaitForEnd(child);
    const std::optional<Message> message = Receive(in.Number());
    return message ? Judge(*message, domain) : WinbindAnswer{Kind::kSilent, ""};
}

}  // namespace TAVO::Platform
