#include "tests/support/server.h"

#include <arpa/inet.h>
#include <netinet/in.h>
#include <openssl/err.h>
#include <signal.h>
#include <sys/socket.h>
#include <unistd.h>

#include <algorithm>
#include <cstdlib>
#include <sstream>
#include <stdexcept>
#include <utility>

namespace Test {

namespace {

constexpr char kEndOfHeader[] = "\r\n\r\n";

void Require(bool condition, const char *what) {
    if (!condition) {
        throw std::runtime_error(what);
    }
}

std::size_t BodyLength(const std::string &header) {
    constexpr char kField[] = "\r\nContent-Length: ";
    const std::size_t field = header.find(kField);
    return field == std::string::npos ? 0 : std::stoul(header.substr(field + sizeof kField - 1));
}

void WriteAll(BIO *connection, const std::string &bytes) {
    std::size_t written = 0;
    while (written < bytes.size()) {
        const int length = static_cast<int>(std::min<std::size_t>(bytes.size() - written, 1 << 20));
        const int count = BIO_write(connection, bytes.data() + written, length);
        if (count <= 0) {
            return;  // the client has disconnected
        }
        written += static_cast<std::size_t>(count);
    }
}

std::shared_ptr<SSL_CTX> MakeTLS(const Credentials &credentials, int onlyVersion) {
    std::shared_ptr<SSL_CTX> context(SSL_CTX_new(TLS_server_method()), SSL_CTX_free);
    Require(context != nullptr, "SSL_CTX_new");
    // The client must reject weak certificates, not the server.
    SSL_CTX_set_security_level(context.get(), 0);
    Require(SSL_CTX_use_certificate(context.get(), credentials.certificate.get()) == 1 &&
                SSL_CTX_use_PrivateKey(context.get(), credentials.key.get()) == 1,
            "credentials of a server");
    Require(credentials.intermediate == nullptr ||
                SSL_CTX_add1_chain_cert(context.get(), credentials.intermediate.get()) == 1,
            "certificate of the intermediate authority");
    Require(SSL_CTX_set_min_proto_version(context.get(), onlyVersion) == 1 &&
                SSL_CTX_set_max_proto_version(context.get(), onlyVersion) == 1,
            "version of TLS");
    return context;
}

std::string Head(const std::string &status, const std::string &fields) {
    return "HTTP/1.1 " + status + "\r\nContent-Type: application/json\r\n" + fields + kEndOfHeader;
}

}  // namespace

std::string HTTPAnswer(const std::string &body, const std::string &status) {
    return Head(status, "Content-Length: " + std::to_string(body.size())) + body;
}

std::string CutHTTPAnswer(const std::string &body, std::size_t missing) {
    return Head("200 OK", "Content-Length: " + std::to_string(body.size() + missing)) + body;
}

std::string ChunkedHTTPAnswer(const std::vector<std::string> &chunks) {
    std::ostringstream answer;
    answer << Head("200 OK", "Transfer-Encoding: chunked") << std::hex;
    for (const std::string &chunk : chunks) {
        answer << chunk.size() << "\r\n" << chunk << "\r\n";
    }
    answer << "0\r\n\r\n";
    return answer.str();
}

Connection::Connection(int socket, SSL_CTX *tls, OnRequest onRequest)
    : socket_(socket), chain_(BIO_new_socket(socket, BIO_CLOSE)), onRequest_(std::move(onRequest)) {
    if (tls != nullptr) {
        chain_.reset(BIO_push(BIO_new_ssl(tls, 0), chain_.release()));
    }
}

Connection::~Connection() {
    SSL *tls = nullptr;
    if (BIO_get_ssl(chain_.get(), &tls) == 1) {
        SSL_shutdown(tls);
    }
    shutdown(socket_, SHUT_WR);
    while (!ReceiveRaw().empty()) {
    }
}

std::string Connection::ReceiveRequest() {
    std::string request;
    std::size_t length = std::string::npos;
    while (request.size() < length) {
        char bytes[4096];
        const int count = BIO_read(chain_.get(), bytes, sizeof bytes);
        if (count <= 0) {
            return {};
        }
        request.append(bytes, static_cast<std::size_t>(count));
        const std::size_t end = request.find(kEndOfHeader);
        if (length == std::string::npos && end != std::string::npos) {
            length = end + sizeof kEndOfHeader - 1 + BodyLength(request.substr(0, end));
        }
    }
    onRequest_(request);
    return request;
}

void Connection::Send(const std::string &bytes) { WriteAll(chain_.get(), bytes); }

void Connection::SendByteByByte(const std::string &bytes) {
    for (const char byte : bytes) {
        Send(std::string(1, byte));
    }
}

std::string Connection::ReceiveRaw() {
    char bytes[4096];
    const ssize_t count = recv(socket_, bytes, sizeof bytes, 0);
    return count > 0 ? std::string(bytes, static_cast<std::size_t>(count)) : std::string();
}

void Connection::SendRaw(const std::string &bytes) {
    BIO *end = chain_.get();
    for (BIO *next = end; next != nullptr; next = BIO_next(next)) {
        end = next;
    }
    WriteAll(end, bytes);
}

void Connection::BreakOff() { shutdown(socket_, SHUT_WR); }

Port::Port() : socket_(::socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0)) {
    sockaddr_in address{};
    address.sin_family = AF_INET;
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    Require(bind(socket_, reinterpret_cast<sockaddr *>(&address), sizeof address) == 0, "bind");
    // A proxy from the environment cannot reach the loopback.
    setenv("no_proxy", "*", 1);
}

Port::~Port() { close(socket_); }

std::uint16_t Port::number() const {
    sockaddr_in address{};
    socklen_t length = sizeof address;
    Require(getsockname(socket_, reinterpret_cast<sockaddr *>(&address), &length) == 0, "getsockname");
    return ntohs(address.sin_port);
}

Server::Server() {
    Require(listen(port_.socket(), SOMAXCONN) == 0, "listen");
    thread_ = std::thread(&Server::Serve, this);
}

Server::Server(const Credentials &credentials, int onlyVersion) : tls_(MakeTLS(credentials, onlyVersion)) {
    Require(listen(port_.socket(), SOMAXCONN) == 0, "listen");
    thread_ = std::thread(&Server::Serve, this);
}

Server::~Server() {
    stopping_ = true;
    shutdown(port_.socket(), SHUT_RDWR);  // interrupts accept
    thread_.join();
}

std::string Server::URL(const std::string &path, const std::string &host) const {
    return (tls_ ? "https://" : "http://") + host + ":" + std::to_string(port_.number()) + path;
}

void Server::Play(Script script) {
    const std::lock_guard<std::mutex> lock(mutex_);
    scripts_.push_back(std::move(script));
}

void Server::Answer(const std::string &bytes) {
    Play([bytes](Connection &connection) {
        if (!connection.ReceiveRequest().empty()) {
            connection.Send(bytes);
        }
    });
}

std::vector<std::string> Server::Requests() const {
    const std::lock_guard<std::mutex> lock(mutex_);
    return requests_;
}

std::vector<std::string> Server::RequestLines() const {
    std::vector<std::string> lines;
    for (const std::string &request : Requests()) {
        lines.push_back(request.substr(0, request.find("\r\n")));
    }
    return lines;
}

void Server::Serve() {
    // A disconnecting client must not end the program.
    sigset_t brokenPipe;
    sigemptyset(&brokenPipe);
    sigaddset(&brokenPipe, SIGPIPE);
    pthread_sigmask(SIG_BLOCK, &brokenPipe, nullptr);

    while (!stopping_) {
        const int socket = accept4(port_.socket(), nullptr, nullptr, SOCK_CLOEXEC);
        if (socket < 0) {
            continue;  // stopping, or the client has disconnected
        }
        ERR_clear_error();  // entries of the previous connection would count for this one
        Connection connection(socket, tls_.get(), [this](const std::string &request) { Record(request); });
        NextScript()(connection);
    }
}

Script Server::NextScript() {
    const std::lock_guard<std::mutex> lock(mutex_);
    if (scripts_.empty()) {
        return [](Connection &connection) { connection.ReceiveRequest(); };
    }
    Script script = std::move(scripts_.front());
    scripts_.pop_front();
    return script;
}

void Server::Record(const std::string &request) {
    const std::lock_guard<std::mutex> lock(mutex_);
    requests_.push_back(request);
}

}  // namespace Test
