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

// The header is one for C, and takes the standard types for granted.
extern "C" {
#include <wbclient.h>
}

namespace TAVO::Platform {

namespace {

using Kind = WinbindAnswer::Kind;

constexpr unsigned int kPatience = 1;  // seconds

/// What the child tells its parent: in one piece, which a pipe takes and gives as a whole.
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

/// A text that is missing, or too long to be a name, leaves the copy empty.
void Copy(const char *text, std::array<char, 256> &copy) {
    if (text != nullptr && std::strlen(text) < copy.size()) {
        std::memcpy(copy.data(), text, std::strlen(text));
    }
}

Message Ask(const char *domain) {
    Message message{};
    struct wbcDomainInfo *information = nullptr;  // a function has the same name
    message.error = ::wbcDomainInfo(domain, &information);
    const std::unique_ptr<struct wbcDomainInfo, decltype(&wbcFreeMemory)> owner(information, wbcFreeMemory);
    if (message.error == WBC_ERR_SUCCESS) {
        Copy(information->dns_name, message.dnsName);
        Copy(information->short_name, message.netBIOSName);
    }
    return message;
}

/// The child's whole life. libwbclient waits for minutes, and nothing limits that; the kernel ends the child instead,
/// whatever the host does with the signal.
[[noreturn]] void AskInChild(const char *domain, int out) {
    std::signal(SIGALRM, SIG_DFL);
    sigset_t signals;
    sigemptyset(&signals);
    sigaddset(&signals, SIGALRM);
    sigprocmask(SIG_UNBLOCK, &signals, nullptr);
    alarm(kPatience);
    // libwbclient looks into it for who is to be asked, and whether at all: a login that runs with raised ids does not
    // let its caller's environment decide.
    environ = nullptr;
    const Message message = Ask(domain);
    // Of the host, nothing is flushed and no handler runs a second time.
    _exit(write(out, &message, sizeof message) == sizeof message ? 0 : 1);
}

/// Returns when the child has ended, whoever has been told of that: the host may have its children collected.
void WaitForEnd(pid_t child) {
    while (waitpid(child, nullptr, 0) < 0 && errno == EINTR) {
    }
}

/// What the child wrote, if anything. It has ended: nothing is waited for, also where the host has forked meanwhile and
/// the pipe's other end lives on.
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
    // winbindd knows domains by their NetBIOS names, too, and itself by names without a DNS: one who can choose the
    // part behind the at sign must not choose among those.
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
