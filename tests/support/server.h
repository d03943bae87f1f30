#ifndef TAVOSSO_TESTS_SUPPORT_SERVER_H
#define TAVOSSO_TESTS_SUPPORT_SERVER_H

#include <openssl/ssl.h>

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <deque>
#include <memory>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

#include "tests/support/authority.h"

namespace Test {

/// An answer of HTTP/1.1 with its length told.
std::string HTTPAnswer(const std::string &body, const std::string &status = "200 OK");

/// The same, but it tells more bytes than there are: the server goes away half-way.
std::string CutHTTPAnswer(const std::string &body, std::size_t missing);

/// An answer in the chunked coding (RFC 9112, section 7.1).
std::string ChunkedHTTPAnswer(const std::vector<std::string> &chunks);

/// A TCP port of 127.0.0.1 that the kernel chose. As long as nobody listens on it, it refuses connections, and belongs
/// to nobody else.
class Port {
  public:
    Port();
    ~Port();
    Port(const Port &) = delete;
    Port &operator=(const Port &) = delete;

    int socket() const { return socket_; }
    std::uint16_t number() const;

  private:
    int socket_;
};

/// A server that answers what it was told, whatever it is asked: one answer for each connection, then it closes that.
class Server {
  public:
    Server();                                         // HTTP
    explicit Server(const Credentials &credentials);  // HTTPS
    ~Server();
    Server(const Server &) = delete;
    Server &operator=(const Server &) = delete;

    std::string URL(const std::string &path, const std::string &host = "127.0.0.1") const;

    /// What it sends, byte by byte, to the next connection that has no answer yet. A connection without one is closed
    /// as soon as it has asked.
    void Answer(const std::string &bytes);

    /// Every request so far, byte by byte. A connection that never sends a whole one, because its client refused the
    /// certificate for instance, leaves none.
    std::vector<std::string> Requests() const;

    /// Their first lines.
    std::vector<std::string> RequestLines() const;

  private:
    void Serve();
    void Converse(BIO *connection);
    std::string Record(const std::string &request);

    Port port_;
    std::shared_ptr<SSL_CTX> tls_;
    mutable std::mutex mutex_;
    std::deque<std::string> answers_;
    std::vector<std::string> requests_;
    std::atomic<bool> stopping_{false};
    std::thread thread_;
};

}  // namespace Test

#endif
