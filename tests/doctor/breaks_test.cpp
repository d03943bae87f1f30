#include <arpa/inet.h>
#include <gmock/gmock.h>
#include <netinet/in.h>
#include <sys/mount.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <unistd.h>

#include <boost/algorithm/string/case_conv.hpp>
#include <boost/algorithm/string/replace.hpp>
#include <cstdio>
#include <ctime>
#include <filesystem>
#include <fstream>
#include <functional>
#include <iostream>
#include <iterator>
#include <memory>
#include <string>
#include <vector>

#include "tests/doctor/appliance.h"
#include "tests/doctor/doctor_process.h"
#include "tests/support/authority.h"
#include "tests/support/files.h"
#include "tests/support/token.h"

// What breaks a working installation. For each break, the first finding names the cause and a remedy, and no finding
// misleads. Prints each break with the finding.
namespace Test {

namespace {

using ::testing::HasSubstr;
using ::testing::StartsWith;

constexpr char kHost[] = "IP:127.0.0.1";
constexpr char kOtherTenant[] = "99999999-9b7a-4c3d-8e5f-0a1b2c3d4e5f";
constexpr char kVar[] = "/usr/tavo/var";
constexpr uid_t kNobody = 65534;
constexpr std::time_t kHour = 3600;
constexpr std::time_t kDay = 24 * kHour;

/// A working installation, and how the administrator runs the doctor.
struct Site {
    explicit Site(const Credentials &credentials) : appliance(Profile::kAzure, credentials) {}

    Appliance appliance;
    Strings through;    // another command
    Strings arguments;  // of the doctor
    std::vector<std::shared_ptr<void>> resources;
};

/// $BASE in a text is the provider's address.
struct Break {
    std::string name;
    std::function<void(Site &site)> arrange;
    std::string id;  // of the first finding
    std::string cause;
    std::string remedy;
    Strings others = {};  // ids of the other findings
    Credentials (*certificate)() = [] { return CertificateFor(kHost); };
};

void PrintTo(const Break &row, std::ostream *stream) { *stream << row.name; }

std::string TimeText(const char *format, std::time_t time) {
    char text[64];
    std::tm utc{};
    gmtime_r(&time, &utc);
    return {text, std::strftime(text, sizeof text, format, &utc)};
}

Credentials CertificateBetween(std::time_t begin, std::time_t end) {
    CertificateText text;
    text.alternativeName = kHost;
    text.notBefore = TimeText("%Y%m%d%H%M%SZ", begin);
    text.notAfter = TimeText("%Y%m%d%H%M%SZ", end);
    return Certify(text, &Authority());
}

/// A server's certificate of an intermediate authority that ends at this time.
Credentials CertificateByIntermediate(std::time_t end, bool sendsIntermediate = true) {
    CertificateText authority = AuthorityText("Intermediate authority");
    authority.notAfter = TimeText("%Y%m%d%H%M%SZ", end);
    const Credentials intermediate = Certify(authority, &Authority());
    CertificateText text;
    text.alternativeName = kHost;
    Credentials credentials = Certify(text, &intermediate);
    credentials.intermediate = sendsIntermediate ? intermediate.certificate : nullptr;
    return credentials;
}

/// An address that refuses connections while the program runs.
std::string NobodysURL(const std::string &scheme = "https") {
    static const Port port;
    return scheme + "://127.0.0.1:" + std::to_string(port.number()) + "/";
}

/// A server that runs as long as the site.
template <typename... Arguments>
Server &AddServer(Site &site, const Script &script, const Arguments &...arguments) {
    const auto server = std::make_shared<Server>(arguments...);
    for (int i = 0; i < 10; ++i) {
        server->Play(script);
    }
    site.resources.push_back(server);
    return *server;
}

/// Accepts connections and sends nothing.
void StaySilent(Connection &connection) {
    connection.ReceiveRaw();
    connection.ReceiveRaw();  // until the client disconnects
}

Script AnswerEmpty(const std::string &status) {
    return [status](Connection &connection) {
        connection.ReceiveRequest();
        connection.Send(HTTPAnswer("", status));
    };
}

void UseProxy(Site &site, const std::string &proxy) {
    site.through = {"/usr/bin/env", "no_proxy=", "NO_PROXY=", "https_proxy=" + proxy};
}

void Mount(Site &site, const char *source, const std::string &target, const char *type, unsigned long flags,
           const char *data = nullptr) {
    ASSERT_EQ(mount(source, target.c_str(), type, flags, data), 0) << target;
    site.resources.emplace_back(&site, [target](void *) { umount2(target.c_str(), MNT_DETACH); });
}

/// A name server that does not answer.
class SilentNameServer {
  public:
    SilentNameServer() : socket_(socket(AF_INET, SOCK_DGRAM | SOCK_CLOEXEC, 0)) {
        sockaddr_in address = {};
        address.sin_family = AF_INET;
        address.sin_port = htons(53);
        address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
        isBound_ = bind(socket_, reinterpret_cast<sockaddr *>(&address), sizeof address) == 0;
    }
    ~SilentNameServer() { close(socket_); }
    SilentNameServer(const SilentNameServer &) = delete;
    SilentNameServer &operator=(const SilentNameServer &) = delete;

    bool IsBound() const { return isBound_; }

  private:
    int socket_;
    bool isBound_;
};

void SilenceNameServer(Site &site) {
    const auto server = std::make_shared<SilentNameServer>();
    ASSERT_TRUE(server->IsBound());
    site.resources.push_back(server);
    std::filesystem::path settings = "/etc/resolv.conf";
    if (std::filesystem::is_symlink(settings)) {
        // To a file in /run, which is empty here.
        settings = (settings.parent_path() / std::filesystem::read_symlink(settings)).lexically_normal();
    }
    if (!std::filesystem::exists(settings)) {
        WriteFile(settings, "");
    }
    WriteFile("/tmp/resolv.conf", "nameserver 127.0.0.1\n");
    Mount(site, "/tmp/resolv.conf", settings, nullptr, MS_BIND);
}

/// Changes the owner of a path to an ordinary user.
void GiveAway(const std::string &path) {
    if (chown(path.c_str(), kNobody, kNobody) != 0) {
        GTEST_SKIP() << "needs the ids of other users";
    }
}

void RequireOtherUsers() {
    WriteFile("/tmp/probe", "");
    GiveAway("/tmp/probe");
}

void SetMode(const std::string &path, mode_t mode) { ASSERT_EQ(chmod(path.c_str(), mode), 0) << path; }

/// The folders as the front end creates them.
void MakeFolders() {
    std::filesystem::create_directories(std::string(kVar) + "/frontend/logins");
    SetMode("/usr/tavo/var/frontend", 0700);
    SetMode("/usr/tavo/var/frontend/logins", 0700);
}

std::function<void(Site &)> WriteText(const char *path, const std::string &content) {
    return [path, content](Site & /*site*/) { WriteFile(path, content); };
}

std::function<void(Site &)> RunWith(const Strings &arguments) {
    return [arguments](Site &site) { site.arguments = arguments; };
}

/// Inserts text after the first brace.
std::function<void(Site &)> InsertIntoClientFile(const std::string &inserted) {
    return [inserted](Site & /*site*/) {
        std::ifstream file(kAzureFile);
        const std::string text{std::istreambuf_iterator<char>(file), {}};
        WriteFile(kAzureFile, "{" + inserted + text.substr(1));
    };
}

std::function<void(Site &)> SetClient(const std::string &name, const Json::Value &value) {
    return [name, value](Site &site) { site.appliance.SetClient(name, value); };
}

/// Sets an address of the client's file. $BASE is the provider's.
std::function<void(Site &)> SetAddress(const std::string &name, const std::string &address) {
    return [name, address](Site &site) {
        site.appliance.SetClient(name, boost::replace_all_copy(address, "$BASE", site.appliance.URL("")));
    };
}

/// The same, and the provider publishes this address.
std::function<void(Site &)> MoveEndpoint(const std::string &name, const std::string &address) {
    return [name, address](Site &site) {
        site.appliance.MoveEndpoint(name, boost::replace_all_copy(address, "$BASE", site.appliance.URL("")));
    };
}

std::function<void(Site &)> Answer(const std::string &path, const std::string &answer) {
    return [path, answer](Site &site) {
        site.appliance.AnswerAt(path, [answer](const std::string & /*request*/) { return answer; });
    };
}

std::string Page(const std::string &status, const std::string &html) {
    return "HTTP/1.1 " + status + "\r\nContent-Type: text/html\r\nContent-Length: " + std::to_string(html.size()) +
           "\r\n\r\n" + html;
}

std::string Redirect(const std::string &address) {
    return "HTTP/1.1 302 Found\r\nLocation: " + address + "\r\nContent-Length: 0\r\n\r\n";
}

std::string WithHeader(std::string answer, const std::string &header) {
    return answer.insert(answer.find("\r\n"), "\r\n" + header);
}

std::string DateHeader(std::time_t offset) {
    return "Date: " + TimeText("%a, %d %b %Y %H:%M:%S GMT", std::time(nullptr) + offset);
}

/// Replaces the tenant in the provider's address.
std::string AddressFor(const Site &site, const std::string &tenant, const std::string &path) {
    return boost::replace_all_copy(site.appliance.URL(path), kTenant, tenant);
}

std::function<void(Site &)> ShareAddress(const std::string &name, const std::string &tenant) {
    return [name, tenant](Site &site) {
        site.appliance.SetClient(name, AddressFor(site, tenant, name == "wellknown" ? "/discovery" : '/' + name));
    };
}

/// The redirect URI of a web server on this machine, which answers so.
std::function<void(Site &)> AnswerReturn(const std::string &status) {
    return [status](Site &site) {
        Server &server = AddServer(
            site,
            [status](Connection &connection) {
                connection.ReceiveRequest();
                connection.Send("HTTP/1.1 " + status + "\r\nContent-Length: 0\r\n\r\n");
            },
            CertificateFor(kHost));
        site.appliance.SetClient("redirect_uri", server.URL("/webman/sso/return.cgi"));
    };
}

std::vector<Break> BreaksOfAzureSettings() {
    const std::string setTenant = "Set azure_tenant_id to \"" + std::string(kTenant) + "\"";
    return {
        {"TenantCommon", SetClient("tenant_id", "common"), "client.tenant_id", "\"common\" is not a GUID", setTenant},
        {"TenantOrganizations", SetClient("tenant_id", "organizations"), "client.tenant_id",
         "\"organizations\" is not a GUID", setTenant},
        {"TenantIsDomainName", SetClient("tenant_id", "corp.onmicrosoft.com"), "client.tenant_id",
         "\"corp.onmicrosoft.com\" is not a GUID", setTenant},
        {"TenantInCapitals", SetClient("tenant_id", boost::to_upper_copy(std::string(kTenant))), "discovery.tenant",
         "azure_tenant_id is \"" + boost::to_upper_copy(std::string(kTenant)) + "\"", setTenant},
        {"TenantInCapitalsWithoutIssuer",
         [](Site &site) {
             site.appliance.SetClient("tenant_id", boost::to_upper_copy(std::string(kTenant)));
             site.appliance.ChangeDiscovery(R"({"issuer": "https://sts.example/"})");
         },
         "discovery.tenant", "azure_tenant_id is \"" + boost::to_upper_copy(std::string(kTenant)) + "\"", setTenant},
        {"TenantOfOtherDirectory", SetClient("tenant_id", kOtherTenant), "client.tenant",
         "azure_wellknown belongs to the tenant \"" + std::string(kTenant) + "\", azure_tenant_id is \"" + kOtherTenant,
         setTenant},
        {"AddressOfOtherDirectory", ShareAddress("authorization_endpoint", kOtherTenant), "client.tenant",
         "azure_authorization_endpoint belongs to the tenant \"" + std::string(kOtherTenant),
         "Set azure_authorization_endpoint to \"$BASE/authorization_endpoint\""},
        {"ClientIDIsName", SetClient("client_id", "NAS of the lab"), "client.client_id", "is not a GUID",
         "Set azure_client_id to the client (application) ID at the provider"},
        {"IDAndSecretSwapped",
         [](Site &site) {
             site.appliance.SetClient("client_id", kClientSecret);
             site.appliance.SetClient("client_secret", kClientID);
         },
         "client.client_id", "they are swapped", "Swap the values of azure_client_id and azure_client_secret."},
        {"TokenEndpointOfVersion2", MoveEndpoint("token_endpoint", "$BASE/oauth2/v2.0/token_endpoint"),
         "client.version", "azure_wellknown, azure_authorization_endpoint are v1, azure_token_endpoint is v2.0",
         "Set azure_token_endpoint to \"$BASE/oauth2/token_endpoint\""},
        {"DiscoveryOfVersion2",
         [](Site &site) {
             site.appliance.SetClient("wellknown", site.appliance.URL("/v2.0/discovery"));
             for (const char *endpoint : {"authorization_endpoint", "token_endpoint"}) {
                 site.appliance.ChangeDiscovery("{\"" + std::string(endpoint) + "\": \"" +
                                                site.appliance.URL("/oauth2/v2.0/") + endpoint + "\"}");
             }
         },
         "client.version", "azure_wellknown is v2.0", "Set azure_wellknown to \"$BASE/discovery\""},
        {"CommonInDiscovery",
         [](Site &site) {
             site.appliance.SetClient("wellknown", AddressFor(site, "common", "/discovery"));
             site.appliance.ChangeDiscovery(R"({"authorization_endpoint": ")" +
                                            AddressFor(site, "common", "/authorization_endpoint") + "\"}");
         },
         "client.tenant", "azure_wellknown is for the users of several tenants: it contains \"common\"",
         "Set azure_wellknown to \"$BASE/discovery\""},
        {"CommonInAuthorizationEndpoint", ShareAddress("authorization_endpoint", "common"), "client.tenant",
         "azure_authorization_endpoint is for the users of several tenants: it contains \"common\"",
         "Set azure_authorization_endpoint to \"$BASE/authorization_endpoint\""},
        {"OrganizationsInTokenEndpoint", ShareAddress("token_endpoint", "organizations"), "client.tenant",
         "azure_token_endpoint is for the users of several tenants: it contains \"organizations\"",
         "Set azure_token_endpoint to \"$BASE/token_endpoint\""},
        {"SecretWrong", SetClient("client_secret", "the one of last year"), "token_endpoint.client",
         "The provider refused: invalid_client", "create a new client secret"},
    };
}

std::vector<Break> BreaksOfDomains() {
    return {
        {"DomainWithoutName", WriteText(kDomainTable, R"({"corp.example": "CORP", "lab.example": 7})"),
         "directory.table", "\"lab.example\" has no NetBIOS name", "Write its name in quotation marks"},
        {"DomainTableIsCut", WriteText(kDomainTable, R"({"corp.example": "CORP")"), "directory.table",
         "domains.conf is not JSON: Line 1, Column 24", "Write an object: {\"corp.example.net\": \"CORP\"}"},
        {"DomainTableIsList", WriteText(kDomainTable, R"(["corp.example", "CORP"])"), "directory.table",
         "domains.conf is JSON, but not an object", "Write an object"},
        {"DomainTableIsEmpty", WriteText(kDomainTable, ""), "directory.table", "domains.conf is empty",
         "Write the file"},
        {"DomainTableInUTF16", WriteText(kDomainTable, std::string("\xff\xfe{\0}\0", 6)), "directory.table",
         "is UTF-16 or binary", "Save the file as UTF-8"},
        {"DomainTwice", WriteText(kDomainTable, "{\"corp.example\": \"CORP\",\n\"corp.example\": \"ACME\"}"),
         "directory.duplicate_key", "line 2: the key \"corp.example\" occurs twice", "Remove one of the lines."},
        {"DomainTableNotUTF8", WriteText(kDomainTable, "{\"corp.example\": \"CORP\", \"b\xfc.example\": \"B\"}"),
         "directory.encoding", "line 1, column 28: a byte that is not UTF-8", "Save the file as UTF-8"},
        {"DomainUnknown", RunWith({"--domain", "alice@lab.example"}), "directory.domain", "is not converted",
         R"(domains.conf: {"lab.example": "NAME"})"},
    };
}

std::vector<Break> BreaksOfUsers() {
    return {
        {"OrdinaryUser",
         [](Site &site) {
             RequireOtherUsers();
             site.through = {"/usr/bin/setpriv", "--reuid=65534", "--regid=65534", "--clear-groups"};
         },
         "process.user",
         "not root",
         "Run: sudo tavosso-doctor",
         {"profile.file"}},
        {"FolderRefusesRoot",
         [](Site &site) {
             GiveAway("/usr/tavo/etc");
             SetMode("/usr/tavo/etc", 0700);
             site.through = {"/usr/bin/setpriv", "--bounding-set=-dac_override,-dac_read_search"};
         },
         "profile.file", "/usr/tavo/etc refuses: mode 0700, owner nobody", "a security module refuses"},
        {"UserCannotReadProfile",
         [](Site &site) {
             RequireOtherUsers();
             site.arguments = {"--user", "nobody"};
         },
         "profile.file", "profile.conf refuses: mode 0600, owner root",
         "sudo chmod a+r /usr/tavo/etc/ssoclient/profile.conf"},
    };
}

std::vector<Break> BreaksOfNetwork() {
    return {
        {"PortRefused", SetAddress("wellknown", NobodysURL()), "discovery.reachable",
         "cannot connect to 127.0.0.1 port " + NobodysURL().substr(18, NobodysURL().size() - 19) +
             ": Connection refused",
         "Check host and port in azure_wellknown"},
        {"NoRoute", SetAddress("wellknown", "https://192.0.2.1/discovery"), "discovery.reachable",
         "cannot connect to 192.0.2.1 port 443: Network is unreachable", "ip route"},
        {"NoRouteForIPv6", SetAddress("wellknown", "https://[2001:db8::1]/discovery"), "discovery.reachable",
         "cannot connect to 2001:db8::1 port 443: ", "ip -6 route"},
        {"NameUnresolved", SetAddress("wellknown", "https://login.invalid/discovery"), "discovery.reachable",
         "\"login.invalid\" cannot be resolved", "Test: getent hosts login.invalid."},
        {"NameServerSilent",
         [](Site &site) {
             SilenceNameServer(site);
             site.appliance.SetClient("wellknown", "https://login.example/discovery");
             site.arguments = {"--timeout", "2"};
         },
         "discovery.reachable", " s from the name server", "/etc/resolv.conf"},
        {"HostSilent",
         [](Site &site) {
             site.appliance.SetClient("wellknown", AddServer(site, StaySilent, CertificateFor(kHost)).URL("/"));
             site.arguments = {"--timeout", "2"};
         },
         "discovery.reachable", " s from 127.0.0.1 port ", "--timeout"},
        {"ServerSpeaksHTTP",
         [](Site &site) {
             const Script refuse = [](Connection &connection) {
                 connection.ReceiveRaw();
                 connection.Send(HTTPAnswer("", "400 Bad Request"));
             };
             const std::string address = AddServer(site, refuse).URL("/");
             site.appliance.SetClient("wellknown", "https" + address.substr(4));
         },
         "discovery.reachable", "the port is not that of a TLS server", "Check the port in azure_wellknown"},
        {"ConnectionBreaks",
         [](Site &site) {
             const Script breakOff = [](Connection &connection) {
                 connection.ReceiveRequest();
                 connection.BreakOff();
             };
             site.appliance.SetClient("wellknown", AddServer(site, breakOff, CertificateFor(kHost)).URL("/"));
         },
         "discovery.reachable", "the connection broke", "Run the command again"},
        {"ProxyRefusesConnection", [](Site &site) { UseProxy(site, NobodysURL("http")); }, "discovery.reachable",
         "cannot connect to the proxy 127.0.0.1 port ", "Correct or unset https_proxy (127.0.0.1 port "},
        {"ProxyUnresolved", [](Site &site) { UseProxy(site, "http://proxy.invalid:3128"); }, "discovery.reachable",
         "the host name of the proxy proxy.invalid port 3128 cannot be resolved",
         "Correct or unset https_proxy (proxy.invalid port 3128)"},
        {"ProxyForbids", [](Site &site) { UseProxy(site, AddServer(site, AnswerEmpty("403 Forbidden")).URL("")); },
         "discovery.reachable", "answers HTTP 403", "Correct or unset https_proxy"},
    };
}

std::vector<Break> BreaksOfCertificates() {
    const auto nothing = [](Site & /*site*/) {};
    const std::string id = "discovery.certificate";
    return {
        {"SelfSigned",
         nothing,
         id,
         "it is self-signed; ",
         "sudo update-ca-certificates",
         {},
         [] { return SelfSignedCertificateFor(kHost); }},
        {"AuthorityUnknown",
         nothing,
         id,
         "its authority is unknown to this machine; ",
         "sudo update-ca-certificates",
         {},
         [] {
             const Credentials other = Certify(AuthorityText("Another authority"), nullptr);
             CertificateText text;
             text.alternativeName = kHost;
             return Certify(text, &other);
         }},
        {"IntermediateNotSent",
         nothing,
         id,
         "its authority is unknown to this machine; ",
         "The server sends no intermediate certificate.",
         {},
         [] { return CertificateByIntermediate(std::time(nullptr) + 900 * kDay, false); }},
        {"CertificateExpired",
         nothing,
         id,
         "it expired on ",
         "The provider must renew the certificate.",
         {},
         [] { return ExpiredCertificateFor(kHost); }},
        {"AuthorityExpired",
         nothing,
         id,
         "the certificate of its authority ",
         "The provider must renew the certificate.",
         {},
         [] { return CertificateByIntermediate(std::time(nullptr) - kDay); }},
        {"CertificateNotYetValid",
         nothing,
         id,
         "it is valid from ",
         "sudo timedatectl set-ntp true",
         {},
         [] { return CertificateBetween(std::time(nullptr) + kDay, std::time(nullptr) + 900 * kDay); }},
        {"CertificateOfOtherHost",
         nothing,
         id,
         "the host name \"127.0.0.1\" is not among its names: DNS:sso.example; ",
         "Set azure_wellknown to an address with one of these names",
         {},
         [] { return CertificateFor("DNS:sso.example"); }},
        {"CertificateExpiresSoon",
         nothing,
         id,
         ", 5 days left",
         "renew the certificate before it expires",
         {},
         [] { return CertificateBetween(std::time(nullptr) - kDay, std::time(nullptr) + 5 * kDay + kHour); }},
        {"AuthorityExpiresSoon",
         nothing,
         id,
         ", 3 days left",
         "renew the certificate before it expires",
         {},
         [] { return CertificateByIntermediate(std::time(nullptr) + 3 * kDay + kHour); }},
        {"KeysBySelfSigned",
         [](Site &site) {
             const std::string keys =
                 AddServer(site, AnswerEmpty("404 Not Found"), SelfSignedCertificateFor(kHost)).URL("/keys");
             site.appliance.ChangeDiscovery(R"({"jwks_uri": ")" + keys + "\"}");
         },
         "keys.certificate", "it is self-signed; ", "Check the host in \"jwks_uri\" in the discovery document."},
        {"BundleEmpty", WriteText(kTrustedAuthorities, ""), "network.authorities", "is empty",
         "sudo update-ca-certificates"},
        {"BundleWithoutCertificate", WriteText(kTrustedAuthorities, "no certificate\n"), "network.authorities",
         "contains no certificate", "sudo update-ca-certificates"},
        {"BundleDamaged",
         [](Site & /*site*/) {
             WriteFile(kTrustedAuthorities, "-----BEGIN CERTIFICATE-----\n%%%%\n-----END CERTIFICATE-----\n");
         },
         "network.authorities", "or a damaged one", "sudo update-ca-certificates"},
        {"BundleMissing", [](Site & /*site*/) { std::filesystem::remove(kTrustedAuthorities); }, "network.authorities",
         "is missing or cannot be read", "sudo update-ca-certificates"},
        {"ClockFast", Answer("/keys", WithHeader(HTTPAnswer(KeySet()), DateHeader(-kHour))), "clock",
         " s ahead of the provider's; this machine's clock: 20", "sudo timedatectl set-ntp true"},
        {"ClockSlow", Answer("/keys", WithHeader(HTTPAnswer(KeySet()), DateHeader(kHour))), "clock",
         " s behind the provider's; this machine's clock: 20", "sudo timedatectl set-ntp true"},
        {"ClockFastAndCertificateExpired",
         Answer("/discovery", WithHeader(HTTPAnswer("{}"), DateHeader(-900 * kDay))),
         id,
         "this machine's clock: 20",
         "sudo timedatectl set-ntp true",
         {"clock"},
         [] { return ExpiredCertificateFor(kHost); }},
    };
}

std::vector<Break> BreaksOfAnswers() {
    const std::string document = "discovery.document";
    const std::string copy = "Copy the address of the discovery document from the provider.";
    const std::string wait = "The settings of this machine are not the cause.";
    const std::string error = R"({"error": "invalid_tenant", "error_description": "not found"})";
    return {
        {"DiscoveryEmpty", Answer("/discovery", HTTPAnswer("")), document, "HTTP 200, empty", copy},
        {"DiscoveryIsPage", Answer("/discovery", Page("404 Not Found", "<html><TITLE> No such page </TITLE>")),
         document, "HTTP 404, text/html, titled \"No such page\"", copy},
        {"DiscoveryRedirects", Answer("/discovery", Redirect("https://other.example/login")), document,
         "HTTP 302, redirects to https://other.example/login", "The library does not follow redirects"},
        {"DiscoveryIsError", Answer("/discovery", HTTPAnswer(error, "400 Bad Request")), document,
         "HTTP 400, The provider refused: invalid_tenant (not found)", copy},
        {"DiscoveryFails", Answer("/discovery", Page("500 Internal Server Error", "<title>Oops</title>")), document,
         "HTTP 500, text/html, titled \"Oops\"", wait},
        {"DiscoveryBehindBrokenGateway", Answer("/discovery", Page("502 Bad Gateway", "<h1>502</h1>")), document,
         "HTTP 502, text/html", wait},
        {"DiscoveryUnavailable", Answer("/discovery", HTTPAnswer("", "503 Service Unavailable")), document,
         "HTTP 503, empty", wait},
        {"DiscoveryIsIssuer",
         [](Site &site) {
             site.appliance.AnswerAt("/openid-configuration",
                                     R"({"issuer": "https://a.example", "jwks_uri": "https://a.example/k"})");
             site.appliance.SetClient("wellknown", site.appliance.URL(""));
         },
         document, "HTTP 404", "Set azure_wellknown to \"$BASE/.well-known/openid-configuration\""},
        {"DiscoveryIsIssuerWithSlash",
         [](Site &site) {
             site.appliance.AnswerAt("/openid-configuration",
                                     R"({"issuer": "https://a.example", "jwks_uri": "https://a.example/k"})");
             site.appliance.SetClient("wellknown", site.appliance.URL("/"));
         },
         document, "HTTP 404", "Set azure_wellknown to \"$BASE/.well-known/openid-configuration\""},
        {"DiscoveryWithSlash", SetAddress("wellknown", "$BASE/discovery/"), document, "HTTP 404",
         "Set azure_wellknown to \"$BASE/discovery\""},
        {"DiscoveryWithSlashAndCapitals",
         [](Site &site) {
             site.appliance.SetClient("wellknown", "HTTPS" + site.appliance.URL("/discovery/").substr(5));
         },
         document, "HTTP 404", "Set azure_wellknown to \"HTTPS://127.0.0.1:"},
        {"DiscoveryNamesItsIssuer",
         [](Site &site) {
             site.appliance.AnswerAt("/discovery", R"({"issuer": ")" + site.appliance.URL("/tenant") + "\"}",
                                     "404 Not Found");
             site.appliance.AnswerAt("/openid-configuration", [](const std::string &request) {
                 const bool isIssuers = request.find("/tenant/.well-known/") != std::string::npos;
                 return isIssuers ? HTTPAnswer(R"({"issuer": "https://a.example", "jwks_uri": "https://a.example/k"})")
                                  : HTTPAnswer("", "404 Not Found");
             });
         },
         document, "HTTP 404", "Set azure_wellknown to \"$BASE/tenant/.well-known/openid-configuration\""},
        {"AuthorizationEndpointDiffers",
         SetAddress("authorization_endpoint", "$BASE/authorize"),
         "discovery.authorization_endpoint",
         "the file has \"$BASE/authorize\"",
         "Set azure_authorization_endpoint to \"$BASE/authorization_endpoint\"",
         {"authorization_endpoint.request"}},
        {"TokenEndpointDiffers",
         SetAddress("token_endpoint", "$BASE/tokn"),
         "discovery.token_endpoint",
         "the file has \"$BASE/tokn\"",
         "Set azure_token_endpoint to \"$BASE/token_endpoint\"",
         {"token_endpoint.client"}},
        {"AuthorizationRejected",
         Answer("/authorization_endpoint", Page("400 Bad Request", "<title>redirect_uri did not match</title>")),
         "authorization_endpoint.request", "HTTP 400, text/html, titled \"redirect_uri did not match\"",
         std::string("Compare the client id, and \"") + kReturnURI},
        {"AuthorizationReturnsError",
         Answer("/authorization_endpoint", Redirect(kReturnURI + std::string("?error=unauthorized_client"))),
         "authorization_endpoint.request", "The provider refused: unauthorized_client",
         "Allow the authorization code grant for the client at the provider."},
        {"AuthorizationFails", Answer("/authorization_endpoint", HTTPAnswer("", "500 Internal Server Error")),
         "authorization_endpoint.request", "HTTP 500, empty", wait},
        {"KeysEmpty", Answer("/keys", HTTPAnswer("")), "keys.set", "$BASE/keys returns no key set: HTTP 200, empty",
         "report this to the provider"},
        {"KeysFail", Answer("/keys", Page("502 Bad Gateway", "<h1>502</h1>")), "keys.set", "HTTP 502, text/html", wait},
        {"TokenEndpointIsPage", Answer("/token_endpoint", Page("200 OK", "<title>Sign in</title>")),
         "token_endpoint.client", "HTTP 200, text/html, titled \"Sign in\"", "Report this to the provider."},
        {"TokenEndpointRedirects", Answer("/token_endpoint", Redirect("https://other.example/token")),
         "token_endpoint.client", "redirects to https://other.example/token", "The library does not follow redirects"},
        {"TokenEndpointFails", Answer("/token_endpoint", Page("500 Internal Server Error", "<title>Oops</title>")),
         "token_endpoint.client", "HTTP 500, text/html, titled \"Oops\"", wait},
        {"TokenEndpointUnavailable",
         Answer("/token_endpoint", HTTPAnswer(R"({"error": "temporarily_unavailable"})", "400 Bad Request")),
         "token_endpoint.client", "temporarily_unavailable", "Sign in again later."},
        {"TokenEndpointNamesError",
         Answer("/token_endpoint",
                HTTPAnswer(R"({"error": "invalid_client", "error_description": "AADSTS7000222: expired"})",
                           "401 Unauthorized")),
         "token_endpoint.client", "invalid_client (AADSTS7000222: expired)",
         "Create a new client secret, and set azure_client_secret to its value."},
    };
}

/// Breaks of the profile's file by an editor, and some of the client's.
std::vector<Break> BreaksOfText() {
    struct Text {
        const char *name;
        std::string content;
        const char *cause;
        const char *remedy;
    };
    const Text texts[] = {
        {"Empty", "", "profile.conf is empty", "Write the file"},
        {"Blank", " \n", "profile.conf is empty", "Write the file"},
        {"ByteOrderMark", "\xef\xbb\xbf{\"sso_enable\": true}", "begins with a byte-order mark, at line 1, column 1",
         "Save the file as UTF-8"},
        {"UTF16", std::string("\xff\xfe{\0\n\0}\0", 8), "is UTF-16 or binary, from line 1, column 1",
         "Save the file as UTF-8"},
        {"TrailingComma", "{\n  \"sso_enable\": true,\n}", "line 2, column 21: comma after the last member",
         "Remove the comma."},
        {"SingleQuotes", "{\n  'sso_enable': true\n}", "line 2, column 3: single quote", "double quotation mark"},
        {"SmartQuotes", "{\n  \"a\": \"\xc3\xa4\", \xe2\x80\x9csso_enable\xe2\x80\x9d: true\n}",
         "line 2, column 13: smart quote outside a string", "ordinary quotation mark"},
        {"NoBreakSpace", "{\n\xc2\xa0\"sso_enable\": true\n}", "line 2, column 1: no-break space outside a string",
         "ordinary blank"},
        {"CommentBeforeQuote", "{ // it's\n  /* isn't */ 'a': 1}", "line 2, column 15: single quote",
         "double quotation mark"},
    };
    std::vector<Break> rows;
    for (const Text &text : texts) {
        rows.push_back({std::string("Profile") + text.name, WriteText(kProfileFile, text.content), "profile.file",
                        text.cause, text.remedy});
    }
    const std::vector<Break> others = {
        {"ProfileKeyTwice",
         WriteText(kProfileFile,
                   "{\"sso_enable\": true,\n\"sso_profile\": \"websphere\",\n\"sso_profile\": \"azure\"}"),
         "profile.duplicate_key", "line 3: the key \"sso_profile\" occurs twice", "Remove one of the lines."},
        {"ProfileNotUTF8",
         WriteText(kProfileFile, "{\"sso_enable\": true,\n\"sso_profile\": \"azure\", \"note\": \"\xfc\"}"),
         "profile.encoding", "line 2, column 34: a byte that is not UTF-8", "Save the file as UTF-8"},
        {"ProfileKeyMisspelt",
         WriteText(kProfileFile, R"({"sso_enable": true, "sso_profile": "azure", "SSO_Profile": "websphere"})"),
         "profile.unknown_key", "\"SSO_Profile\" is ignored", "Rename it to \"sso_profile\""},
        {"ProfileMissing", [](Site & /*site*/) { std::filesystem::remove(kProfileFile); }, "profile.file",
         "profile.conf is missing", "man 5 tavosso-profile.conf"},
        {"ClientFileWithComma", WriteText(kAzureFile, "{\"azure_client_id\": \"the client\",}"), "client.file",
         "line 1, column 33: comma after the last member", "Remove the comma."},
        {"ClientKeyTwice", InsertIntoClientFile("\"azure_tenant_id\": \"\",\n"), "client.duplicate_key",
         "line 2: the key \"azure_tenant_id\" occurs twice", "Remove one of the lines."},
        {"ClientFileNotUTF8", InsertIntoClientFile("\n// Z\xfcrich\n"), "client.encoding",
         "line 2, column 5: a byte that is not UTF-8", "Save the file as UTF-8"},
        {"ClientFileMissing", [](Site & /*site*/) { std::filesystem::remove(kAzureFile); }, "client.file",
         "azure.conf is missing", "man 5 tavosso-azure.conf"},
        {"TenantWithNoBreakSpace", SetClient("tenant_id", std::string(kTenant) + "\xc2\xa0"), "client.tenant_id",
         "contains a no-break space", "Type the value of azure_tenant_id again"},
        {"TenantInSmartQuotes", SetClient("tenant_id", "\xe2\x80\x9c" + std::string(kTenant) + "\xe2\x80\x9d"),
         "client.tenant_id", "contains a smart quote", "Type the value of azure_tenant_id again"},
    };
    rows.insert(rows.end(), others.begin(), others.end());
    return rows;
}

std::vector<Break> BreaksOfRights() {
    const std::string var = kVar;
    return {
        {"FolderWritableByOthers",
         [](Site & /*site*/) { SetMode("/usr/tavo/etc", 0777); },
         "profile.rights",
         "/usr/tavo/etc: mode 0777, owner root",
         "sudo chmod go-w /usr/tavo/etc",
         {"client.rights", "directory.rights"}},
        {"FolderOfOtherUser",
         [](Site & /*site*/) { GiveAway("/usr/tavo/etc"); },
         "profile.rights",
         "/usr/tavo/etc: mode 0755, owner nobody",
         "sudo chown root /usr/tavo/etc",
         {"client.rights", "directory.rights"}},
        {"ClientFileReadableByOthers", [](Site & /*site*/) { SetMode(kAzureFile, 0644); }, "client.rights",
         "azure.conf: mode 0644, owner root: other users can read the client secret",
         "sudo chmod 600 /usr/tavo/etc/ssoclient/azure.conf"},
        {"ClientFileOfOtherUser", [](Site & /*site*/) { GiveAway(kAzureFile); }, "client.rights",
         "azure.conf: mode 0600, owner nobody", "sudo chown root /usr/tavo/etc/ssoclient/azure.conf"},
        {"DomainTableWritableByOthers", [](Site & /*site*/) { SetMode(kDomainTable, 0666); }, "directory.rights",
         "domains.conf: mode 0666, owner root", "sudo chmod go-w /usr/tavo/etc/domains.conf"},
        {"FrontEndWithoutFolder", AnswerReturn("303 See Other\r\nLocation: /index.cgi"), "frontend.folder",
         "/usr/tavo/var: No such file or directory", "sudo install -d -m 0755 /usr/tavo/var"},
        {"FrontEndFolderWritableByOthers",
         [](Site & /*site*/) {
             MakeFolders();
             SetMode(kVar, 0777);
         },
         "frontend.folder", "/usr/tavo/var: mode 0777, owner root", "sudo chmod 0755 /usr/tavo/var"},
        {"FrontEndFolderOfOtherUser",
         [](Site & /*site*/) {
             MakeFolders();
             GiveAway(kVar);
         },
         "frontend.folder", "/usr/tavo/var: mode 0755, owner nobody", "sudo chown root /usr/tavo/var"},
        {"LoginsOfOtherUser",
         [](Site & /*site*/) {
             MakeFolders();
             GiveAway("/usr/tavo/var/frontend/logins");
         },
         "frontend.folder", "/usr/tavo/var/frontend/logins: mode 0700, owner nobody",
         "sudo tavosso-doctor --user USER"},
        {"LoginsReadableByOthers",
         [](Site & /*site*/) {
             MakeFolders();
             SetMode("/usr/tavo/var/frontend/logins", 0750);
         },
         "frontend.folder", "/usr/tavo/var/frontend/logins: mode 0750", "sudo rm -r /usr/tavo/var/frontend/logins"},
        {"LoginsIsFile",
         [](Site & /*site*/) {
             MakeFolders();
             std::filesystem::remove("/usr/tavo/var/frontend/logins");
             WriteFile("/usr/tavo/var/frontend/logins", "");
         },
         "frontend.folder", "/usr/tavo/var/frontend/logins: mode 0600", "sudo rm -r /usr/tavo/var/frontend/logins"},
        {"FileSystemFull",
         [](Site &site) {
             std::filesystem::create_directories(kVar);
             Mount(site, "tmpfs", kVar, "tmpfs", 0, "size=4k,mode=0755");
             WriteFile(std::string(kVar) + "/large", std::string(4096, 'x'));
         },
         "frontend.space", "the file system of /usr/tavo/var is full", "df -h /usr/tavo/var"},
        {"FileSystemOfFrontEndFull",
         [](Site &site) {
             MakeFolders();
             Mount(site, "tmpfs", "/usr/tavo/var/frontend", "tmpfs", 0, "size=4k,mode=0700");
             WriteFile("/usr/tavo/var/frontend/large", std::string(4096, 'x'));
         },
         "frontend.space", "the file system of /usr/tavo/var/frontend is full", "sudo du -a /usr/tavo/var/frontend"},
        {"FileSystemReadOnly",
         [](Site &site) {
             std::filesystem::create_directories(kVar);
             Mount(site, "tmpfs", kVar, "tmpfs", MS_RDONLY, "mode=0755");
         },
         "frontend.space", "/usr/tavo/var is on a read-only file system", "findmnt -T /usr/tavo/var"},
    };
}

std::vector<Break> BreaksOfFrontEnd() {
    const std::string redirectURI = "client.redirect_uri";
    return {
        {"RedirectURIIsStartPage", SetClient("redirect_uri", "https://nas.example:5001/"), redirectURI,
         "its path is \"/\"",
         "Set azure_redirect_uri to \"https://nas.example:5001/webman/sso/return.cgi\" here and at the provider"},
        {"RedirectURIWithoutTLS", SetClient("redirect_uri", "http://nas.example/webman/sso/return.cgi"), redirectURI,
         "\"http://nas.example/webman/sso/return.cgi\" must be an https:// URL",
         "https://nas.example/webman/sso/return.cgi"},
        {"ReturnProgramMissing", AnswerReturn("404 Not Found"), "frontend.return", "answers HTTP 404",
         "lighty-enable-mod tavosso-frontend"},
        {"ReturnProgramFails", AnswerReturn("500 Internal Server Error"), "frontend.return", "answers HTTP 500",
         "Read the web server's error log (lighttpd: journalctl -t lighttpd)"},
        {"WebServerStopped", SetAddress("redirect_uri", NobodysURL() + "webman/sso/return.cgi"), "frontend.return",
         "no web server answers at 127.0.0.1 port ", "sudo systemctl restart lighttpd"},
        {"LogoutEndpointWithoutScheme", SetClient("logout_endpoint", "login.example/logout"), "client.logout_endpoint",
         "Sign-in works, sign-out at the provider does not",
         "Set azure_logout_endpoint to \"https://login.example/logout\""},
        {"TokenEndpointWithoutTLS",
         [](Site &site) {
             site.appliance.MoveEndpoint("token_endpoint", "http" + site.appliance.URL("/token_endpoint").substr(5));
         },
         "client.token_endpoint", "is not an https:// URL", "Set azure_token_endpoint to the https:// URL"},
    };
}

std::vector<Break> BreaksByHostileProvider() {
    const std::string huge(5 << 20, 'x');
    const std::string controls = R"({"error": "invalid_client", "error_description": ")"
                                 "\\u001b[2J\\u0007\\u009b31m\\u202e\\u200b\\u2066.\"}";
    return {
        {"DiscoveryHuge", Answer("/discovery", HTTPAnswer("{\"a\": \"" + huge + "\"}")), "discovery.reachable",
         "the response is longer than 4 MiB", "Compare azure_wellknown with the address"},
        {"HeadersHuge", Answer("/keys", WithHeader(HTTPAnswer(KeySet()), "X: " + huge)), "keys.reachable", "$BASE/keys",
         "\"jwks_uri\""},
        {"TokenResponseHuge", Answer("/token_endpoint", HTTPAnswer(huge)), "token_endpoint.reachable",
         "the response is longer than 4 MiB", "Compare azure_token_endpoint with the address"},
        {"ControlsInError", Answer("/token_endpoint", HTTPAnswer(controls, "401 Unauthorized")),
         "token_endpoint.client", "The provider refused: invalid_client", "create a new client secret"},
        {"ControlsInTitle",
         Answer("/discovery", Page("404 Not Found", "<title>\xe2\x80\xae\x1b[2Jdenied\xe2\x80\x8b</title>")),
         "discovery.document", "denied", "Copy the address of the discovery document from the provider."},
        {"ControlsInLocation", Answer("/discovery", Redirect("https://other.example/\xe2\x80\xae\x1b[2J")),
         "discovery.document", "redirects to https://other.example/", "The library does not follow redirects"},
    };
}

std::vector<Break> AllBreaks() {
    std::vector<Break> rows;
    for (const auto &some :
         {BreaksOfAzureSettings(), BreaksOfDomains(), BreaksOfUsers(), BreaksOfNetwork(), BreaksOfCertificates(),
          BreaksOfAnswers(), BreaksOfText(), BreaksOfRights(), BreaksOfFrontEnd(), BreaksByHostileProvider()}) {
        rows.insert(rows.end(), some.begin(), some.end());
    }
    return rows;
}

/// The first finding of a report. Its later lines are indented.
std::string FirstPrinted(const std::string &output) {
    std::size_t end = output.find('\n');
    while (end != std::string::npos && output.compare(end + 1, 9, "         ") == 0) {
        end = output.find('\n', end + 1);
    }
    return output.substr(0, end);
}

class Breaks : public ::testing::TestWithParam<Break> {};

TEST_P(Breaks, FirstFindingNamesCauseAndRemedy) {
    const Break &row = GetParam();
    Site site(row.certificate());
    row.arrange(site);
    if (IsSkipped() || HasFatalFailure()) {
        return;
    }
    const std::string printed = FirstPrinted(RunDoctor(site.arguments, "", site.through).output);
    std::cout << printed << std::endl;
    EXPECT_THAT(printed, StartsWith("[FAIL] "));

    const Report report = AskMachine(site.arguments, "", site.through);
    Strings expected{row.id};
    expected.insert(expected.end(), row.others.begin(), row.others.end());
    EXPECT_EQ(report.Findings(), expected);
    const auto withBase = [&](const std::string &text) {
        return boost::replace_all_copy(text, "$BASE", site.appliance.URL(""));
    };
    EXPECT_THAT(report.FirstFinding().found, HasSubstr(withBase(row.cause)));
    EXPECT_THAT(report.FirstFinding().remedy, HasSubstr(withBase(row.remedy)));
}

INSTANTIATE_TEST_SUITE_P(Doctor, Breaks, ::testing::ValuesIn(AllBreaks()),
                         [](const auto &row) { return row.param.name; });

}  // namespace

}  // namespace Test
