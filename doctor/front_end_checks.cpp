// The front end on this machine: its address, its return program and its folders.
#include <arpa/inet.h>
#include <ifaddrs.h>
#include <sys/stat.h>
#include <sys/statvfs.h>

#include <algorithm>
#include <boost/algorithm/string/predicate.hpp>
#include <cerrno>
#include <memory>
#include <set>
#include <system_error>

#include "doctor/address.h"
#include "doctor/checks.h"
#include "doctor/rights.h"
#include "doctor/transfer_checks.h"
#include "doctor/watch.h"

namespace Doctor {

namespace {

constexpr char kHostID[] = "frontend.host";
constexpr char kHostSubject[] = "host of the redirect URI";
constexpr char kReturnID[] = "frontend.return";
constexpr char kReturnSubject[] = "return program";
constexpr char kFolderID[] = "frontend.folder";
constexpr char kFolderSubject[] = "folder of the front end";
constexpr char kVar[] = "/usr/tavo/var";
constexpr char kStartPage[] = "/index.cgi";  // of the example front end
constexpr long kErrors = 400;                // and above

struct FreeInterfaces {
    void operator()(ifaddrs *interfaces) const { freeifaddrs(interfaces); }
};

std::string TextOf(const sockaddr &address) {
    char text[INET6_ADDRSTRLEN] = {};
    if (address.sa_family == AF_INET) {
        inet_ntop(AF_INET, &reinterpret_cast<const sockaddr_in &>(address).sin_addr, text, sizeof text);
    } else if (address.sa_family == AF_INET6) {
        inet_ntop(AF_INET6, &reinterpret_cast<const sockaddr_in6 &>(address).sin6_addr, text, sizeof text);
    }
    return text;
}

std::set<std::string> OwnAddresses() {
    std::set<std::string> addresses;
    ifaddrs *list = nullptr;
    if (getifaddrs(&list) != 0) {
        return addresses;
    }
    const std::unique_ptr<ifaddrs, FreeInterfaces> owner(list);
    for (const ifaddrs *interface = list; interface != nullptr; interface = interface->ifa_next) {
        if (interface->ifa_addr != nullptr) {
            addresses.insert(TextOf(*interface->ifa_addr));
        }
    }
    return addresses;
}

/// Sends a HEAD request, which neither starts nor finishes a login. Sends no secret, so the certificate is not
/// verified.
Transfer RequestHead(Report &report, const std::string &url) {
    const std::unique_ptr<CURL, void (*)(CURL *)> handle(curl_easy_init(), curl_easy_cleanup);
    if (handle) {
        curl_easy_setopt(handle.get(), CURLOPT_URL, url.c_str());
        curl_easy_setopt(handle.get(), CURLOPT_NOBODY, 1L);
        curl_easy_setopt(handle.get(), CURLOPT_PROXY, "");
        curl_easy_setopt(handle.get(), CURLOPT_SSL_VERIFYPEER, 0L);
        curl_easy_setopt(handle.get(), CURLOPT_SSL_VERIFYHOST, 0L);
        curl_easy_perform(handle.get());
    }
    return LastTransfer(report);
}

/// Returns whether one of the addresses, "ADDRESS port PORT", is of this machine.
bool IsThisMachine(const std::vector<std::string> &addresses) {
    const std::set<std::string> own = OwnAddresses();
    return std::any_of(addresses.begin(), addresses.end(), [&](const std::string &address) {
        return own.count(address.substr(0, address.find(' '))) != 0 || boost::starts_with(address, "127.");
    });
}

/// Checks the return program. Returns whether the example front end runs on this machine: it redirects a HEAD request
/// to its start page.
bool CheckReturnProgram(Report &report, Client &client, const std::string &returnProgram) {
    const std::string url = client->GetRedirectURI();
    const Address address = SplitAddress(url);
    if (!address.isValid || address.scheme != "https" || address.path != returnProgram) {
        report.NotChecked(kReturnID, kReturnSubject, "the redirect URI is not its https:// URL");
        return false;
    }
    const Transfer transfer = RequestHead(report, url);
    if (transfer.addresses.empty() || !IsThisMachine(transfer.addresses)) {
        report.Note(kHostID, kHostSubject,
                    Quoted(address.host) +
                        (transfer.addresses.empty()
                             ? " cannot be resolved here"
                             : " is " + transfer.addresses.front() + ", not an address of this machine") +
                        ": whether browsers reach this machine is unknown",
                    "If no router or proxy forwards this address to this machine, correct the redirect URI here and at "
                    "the provider.");
        return false;
    }
    report.Good(kHostID, kHostSubject, Quoted(address.host) + " is this machine");
    if (transfer.result != CURLE_OK) {
        report.Finding(kReturnID, kReturnSubject,
                       "no web server answers at " + transfer.addresses.front() + ": " + transfer.error,
                       "Start the web server, with TLS on port " + address.port +
                           ". For lighttpd, run: sudo systemctl restart lighttpd; systemctl status lighttpd");
    } else if (transfer.status >= kErrors) {
        report.Finding(kReturnID, kReturnSubject, url + " answers HTTP " + std::to_string(transfer.status),
                       transfer.status >= 500
                           ? "The program failed or is not executable. Read the web server's error log (lighttpd: "
                             "journalctl -t lighttpd), and check that the program is executable."
                           : "Configure the web server to run the return program at this path, and to load its "
                             "module for CGI programs (mod_cgi in server.modules of lighttpd). For lighttpd, run: sudo "
                             "lighty-enable-mod tavosso-frontend; "
                             "sudo systemctl restart lighttpd");
    } else {
        report.Good(kReturnID, kReturnSubject, "answers HTTP " + std::to_string(transfer.status));
    }
    return SplitAddress(transfer.location).path == kStartPage;
}

/// Reports a full or read-only file system. Returns whether the folder's is neither.
bool CheckSpace(Report &report, const std::string &folder) {
    constexpr char kID[] = "frontend.space";
    constexpr char kSubject[] = "space for the front end";
    struct statvfs system = {};
    if (statvfs(folder.c_str(), &system) != 0) {
        return true;
    }
    if ((system.f_flag & ST_RDONLY) != 0) {
        report.Finding(kID, kSubject, folder + " is on a read-only file system",
                       "Find the cause: dmesg. Then mount it writable. Run: findmnt -T " + folder);
        return false;
    }
    // Some file systems do not count their files.
    if (system.f_bavail == 0 || (system.f_files != 0 && system.f_favail == 0)) {
        report.Finding(kID, kSubject, "the file system of " + folder + " is full",
                       "Remove files. Run: df -h " + folder + "; df -i " + folder + "; sudo du -a " + folder);
        return false;
    }
    return true;
}

// A finding as root can be correct for programs of another user.
constexpr char kFindUser[] =
    "Run: ps -o user= -C lighttpd, for the user of the programs. "
    "If it is not root, run: sudo tavosso-doctor --user USER. Otherwise run: ";

/// Returns whether one of the front end's private folders is as it creates them, or does not exist yet.
bool CheckPrivateFolder(Report &report, const std::string &path) {
    struct stat status = {};
    if (lstat(path.c_str(), &status) != 0) {
        return true;
    }
    const bool isPrivate =
        S_ISDIR(status.st_mode) && status.st_uid == geteuid() && (status.st_mode & (S_IRWXG | S_IRWXO)) == 0;
    if (!isPrivate) {
        report.Finding(kFolderID, kFolderSubject,
                       path + ": " + DescribeRights(status) +
                           ". It must be a folder of mode 0700 that belongs to the user of the web server's programs",
                       kFindUser + ("sudo rm -r " + path) + ". The front end creates it again.");
    }
    return isPrivate;
}

void CheckFolders(Report &report, bool isRequired) {
    struct stat status = {};
    if (lstat(kVar, &status) != 0) {
        report.Add(
            {kFolderID, kFolderSubject, isRequired ? Mark::kFinding : Mark::kNote,
             std::string(kVar) + ": " + std::generic_category().message(errno),
             std::string(isRequired ? "Run" : "For the example front end, run") + ": sudo install -d -m 0755 " + kVar,
             ""});
        return;
    }
    if (!S_ISDIR(status.st_mode) || (status.st_mode & (S_IWGRP | S_IWOTH)) != 0) {
        report.Finding(
            kFolderID, kFolderSubject,
            std::string(kVar) + ": " + DescribeRights(status) + ". It must be a folder that other users cannot change",
            std::string("Run: sudo chmod 0755 ") + kVar + ". If it is a link or file, remove it first.");
        return;
    }
    if (status.st_uid != 0 && status.st_uid != geteuid()) {
        report.Finding(kFolderID, kFolderSubject,
                       std::string(kVar) + ": " + DescribeRights(status) +
                           ". It must belong to root, or to the user of the web server's programs",
                       std::string(kFindUser) + "sudo chown root " + kVar);
        return;
    }
    if (!CheckSpace(report, kVar)) {
        return;
    }
    for (const char *name : {"/frontend", "/frontend/logins", "/frontend/sessions"}) {
        const std::string folder = std::string(kVar) + name;
        if (!CheckPrivateFolder(report, folder) || !CheckSpace(report, folder)) {
            return;
        }
    }
    report.Good("frontend.space", "space for the front end", "the file systems are writable");
    report.Good(kFolderID, kFolderSubject, std::string(kVar) + ": " + DescribeRights(status));
}

}  // namespace

void CheckFrontEnd(Report &report, Client &client, const std::string &returnProgram, RunAs runAs) {
    report.Section("Front end");
    const bool isExample = CheckReturnProgram(report, client, returnProgram);
    if (runAs == RunAs::kOrdinaryUser) {
        report.NotChecked(kFolderID, kFolderSubject, "run the command with sudo");
    } else {
        CheckFolders(report, isExample);
    }
}

}  // namespace Doctor
