#ifndef TAVOSSO_TESTS_SUPPORT_SERVER_H
#define TAVOSSO_TESTS_SUPPORT_SERVER_H

#include <openssl/ssl.h>

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <deque>
#include <functional>
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

/// A server's end of one connection. Waiting for a client that has gone gives the empty text, and what is sent to it is
/// lost: that is the client's right.
class Connection {
  public:
    using OnRequest = std::function<void(const std::string &)>;

    /// Takes the socket over. Speaks TLS where there is a context for it, and shakes hands when it first has to.
    Connection(int socket, SSL_CTX *tls, OnRequest onRequest);

    /// Says goodbye, and waits for the client to go: the kernel would take back what was sent if it closed a connection
    /// with something unread in it.
    ~Connection();
    Connection(const Connection &) = delete;
    Connection &operator=(const Connection &) = delete;

    std::string ReceiveRequest();
    void Send(const std::string &bytes);

    /// Each byte in a TLS record of its own.
    void SendByteByByte(const std::string &bytes);

    /// Past TLS: what next arrives, or goes out, on the socket itself.
    std::string ReceiveRaw();
    void SendRaw(const std::string &bytes);

    /// Nothing more goes out, TLS's own goodbye neither.
    void BreakOff();

  private:
    struct Release {
        void operator()(BIO *chain) const { BIO_free_all(chain); }
    };

    int socket_;
    std::unique_ptr<BIO, Release> chain_;
    OnRequest onRequest_;
};

/// What a server does on a connection, which ends with it.
using Script = std::function<void(Connection &)>;

/// A server that does what it was told, whatever it is asked: one script or answer for each connection.
class Server {
  public:
    Server();                                                              // HTTP
    explicit Server(const Credentials &credentials, int onlyVersion = 0);  // HTTPS, of that version of TLS if any
    ~Server();
    Server(const Server &) = delete;
    Server &operator=(const Server &) = delete;

    std::string URL(const std::string &path, const std::string &host = "127.0.0.1") const;

    /// What it does on the next connection that nothing is told for yet. A connection that nothing is told for is
    /// closed as soon as it has asked.
    void Play(Script script);

    /// Waits for a request and sends this, byte for byte.
    void Answer(const std::string &bytes);

    /// Every request so far, byte by byte. A connection that never sends a whole one, because its client refused the
    /// certificate for instance, leaves none.
    std::vector<std::string> Requests() const;

    /// Their first lines.
    std::vector<std::string> RequestLines() const;

  private:
    void Serve();
    Script NextScript();
    void Record(const std::string &request);

    Port port_;
    std::shared_ptr<SSL_CTX> tls_;
    mutable std::mutex mutex_;
    std::deque<Script> scripts_;
    std::vector<std::string> requests_;
    std::atomic<bool> stopping_{false};
    std::thread thread_;
};

}  // namespace Test

#endif
