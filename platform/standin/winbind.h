#ifndef TAVOSSO_PLATFORM_STANDIN_WINBIND_H
#define TAVOSSO_PLATFORM_STANDIN_WINBIND_H

#include <string>

// The machine's winbindd, which knows the domains of the directory that the machine is a member of.
namespace TAVO::Platform {

struct WinbindAnswer {
    enum class Kind {
        kKnown,         // `text` is the domain's NetBIOS name, as the directory spells it
        kUnknown,       // also for a domain that is asked for by another name than that of the DNS
        kNotAvailable,  // nobody listens
        kSilent,        // somebody does, and has not answered within a second
        kNotAsked,      // `text` tells why
    };
    Kind kind;
    std::string text;
};

/// Asks for a domain by its DNS name, whose case does not matter. It is asked by a child process, whose end can be the
/// caller's signal SIGCHLD; no child and no descriptor is left.
WinbindAnswer AskWinbind(const std::string &domain);

}  // namespace TAVO::Platform

#endif
