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

struct ReleaseBIO {
    void operator()(BIO *chain) const { BIO_free_all(chain); }  // says goodbye where it is TLS, and closes the socket
};
using BIOPointer = std::unique_ptr<BIO, ReleaseBIO>;

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

/// A whole request, or the empty text where none arrives.
std::string ReadRequest(BIO *connection) {
    std::string request;
    std::size_t length = std::string::npos;
    while (request.size() < length) {
        char bytes[4096];
        const int count = BIO_read(connection, bytes, sizeof bytes);
        if (count <= 0) {
            return {};
        }
        request.append(bytes, static_cast<std::size_t>(count));
        const std::size_t end = request.find(kEndOfHeader);
        if (length == std::string::npos && end != std::string::npos) {
            length = end + sizeof kEndOfHeader - 1 + BodyLength(request.substr(0, end));
        }
    }
    return request;
}

void WriteAll(BIO *connection, const std::string &bytes) {
    std::size_t written = 0;
    while (written < bytes.size()) {
        const int length = static_cast<int>(std::min<std::size_t>(bytes.size() - written, 1 << 20));
        const int count = BIO_write(connection, bytes.data() + written, length);
        if (count <= 0) {
            return;  // the client has gone: that is its right
        }
        written += static_cast<std::size_t>(count);
    }
}

std::shared_ptr<SSL_CTX> MakeTLS(const Credentials &credentials) {
    std::shared_ptr<SSL_CTX> context(SSL_CTX_new(TLS_server_method()), SSL_CTX_free);
    Require(context && SSL_CTX_use_certificate(context.get(), credentials.certificate.get()) == 1 &&
                SSL_CTX_use_PrivateKey(context.get(), credentials.key.get()) == 1,
            "credentials of a server");
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

Port::Port() : socket_(::socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0)) {
    sockaddr_in address{};
    address.sin_family = AF_INET;
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    Require(bind(socket_, reinterpret_cast<sockaddr *>(&address), sizeof address) == 0, "bind");
    // A proxy that the environment names does not know this machine's loopback.
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

Server::Server(const Credentials &credentials) : tls_(MakeTLS(credentials)) {
    Require(listen(port_.socket(), SOMAXCONN) == 0, "listen");
    thread_ = std::thread(&Server::Serve, this);
}

Server::~Server() {
    stopping_ = true;
    shutdown(port_.socket(), SHUT_RDWR);  // wakes the thread out of accept
    thread_.join();
}

std::string Server::URL(const std::string &path, const std::string &host) const {
    return (tls_ ? "https://" : "http://") + host + ":" + std::to_string(port_.number()) + path;
}

void Server::Answer(const std::string &bytes) {
    const std::lock_guard<std::mutex> lock(mutex_);
    answers_.push_back(bytes);
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
    // A client that goes away early ends its connection, not the program.
    sigset_t brokenPipe;
    sigemptyset(&brokenPipe);
    sigaddset(&brokenPipe, SIGPIPE);
    pthread_sigmask(SIG_BLOCK, &brokenPipe, nullptr);

    while (!stopping_) {
        const int socket = accept4(port_.socket(), nullptr, nullptr, SOCK_CLOEXEC);
        if (socket < 0) {
            continue;  // told to stop, or the client was gone before it was let in
        }
        BIOPointer connection(BIO_new_socket(socket, BIO_CLOSE));
        if (tls_) {
            connection.reset(BIO_push(BIO_new_ssl(tls_.get(), 0), connection.release()));
        }
        Converse(connection.get());
    }
}

void Server::Converse(BIO *connection) {
    ERR_clear_error();  // what the last connection left there would count as this one's
    const std::string request = ReadRequest(connection);
    if (!request.empty()) {
        WriteAll(connection, Record(request));
    }
}

std::string Server::Record(const std::string &request) {
    const std::lock_guard<std::mutex> lock(mutex_);
    requests_.push_back(request);
    if (answers_.empty()) {
        return {};
    }
    std::string answer = std::move(answers_.front());
    answers_.pop_front();
    return answer;
}

}  // namespace Test
