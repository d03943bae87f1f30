#ifndef TAVOSSO_PLATFORM_STANDIN_WINBIND_H
#define TAVOSSO_PLATFORM_STANDIN_WINBIND_H

#include <string>

// Asks winbindd for the domains of the directory that the machine has joined.
namespace TAVO::Platform {

struct WinbindAnswer {
    enum class Kind {
        kKnown,         // `text` is the domain's NetBIOS name, spelt as in the directory
        kUnknown,       // also if the name is not the DNS name of the domain
        kNotAvailable,  // winbindd does not run
        kSilent,        // winbindd did not answer within a second
        kNotAsked,      // `text` is the reason
    };
    Kind kind;
    std::string text;
};

/// Asks for a domain by its DNS name, ignoring case. Forks a child process, so the program may receive SIGCHLD. The
/// child has ended and its descriptors are closed when the function returns.
WinbindAnswer AskWinbind(const std::string &domain);

}  // namespace TAVO::Platform

#endif
