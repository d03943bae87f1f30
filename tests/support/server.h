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

/// An HTTP/1.1 answer with Content-Length.
std::string HTTPAnswer(const std::string &body, const std::string &status = "200 OK");

/// The same, with a Content-Length that exceeds the body by `missing` bytes.
std::string CutHTTPAnswer(const std::string &body, std::size_t missing);

/// An answer in the chunked coding (RFC 9112, section 7.1).
std::string ChunkedHTTPAnswer(const std::vector<std::string> &chunks);

/// A bound TCP port of 127.0.0.1. It refuses connections until a server listens on it.
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

/// The server's end of a connection. If the client has disconnected, receiving returns an empty text and sent data is
/// lost.
class Connection {
  public:
    using OnRequest = std::function<void(const std::string &)>;

    /// Owns the socket. Uses TLS if `tls` is not null; the first read or write performs the handshake.
    Connection(int socket, SSL_CTX *tls, OnRequest onRequest);

    /// Closes TLS and waits for the client to disconnect. If unread data were left, the kernel would discard sent data.
    ~Connection();
    Connection(const Connection &) = delete;
    Connection &operator=(const Connection &) = delete;

    std::string ReceiveRequest();
    void Send(const std::string &bytes);

    /// Sends each byte in a separate TLS record.
    void SendByteByByte(const std::string &bytes);

    /// Bypasses TLS.
    std::string ReceiveRaw();
    void SendRaw(const std::string &bytes);

    /// Ends sending, without a TLS close_notify.
    void BreakOff();

  private:
    struct Release {
        void operator()(BIO *chain) const { BIO_free_all(chain); }
    };

    int socket_;
    std::unique_ptr<BIO, Release> chain_;
    OnRequest onRequest_;
};

/// Handles one connection, which is closed afterwards.
using Script = std::function<void(Connection &)>;

/// A server with one script or answer for each connection, in order.
class Server {
  public:
    Server();                                                              // HTTP
    explicit Server(const Credentials &credentials, int onlyVersion = 0);  // HTTPS; TLS of `onlyVersion` unless 0
    ~Server();
    Server(const Server &) = delete;
    Server &operator=(const Server &) = delete;

    std::string URL(const std::string &path, const std::string &host = "127.0.0.1") const;

    /// Adds a script. A connection without a script is closed after its request.
    void Play(Script script);

    /// Adds a script that waits for a request and sends these bytes.
    void Answer(const std::string &bytes);

    /// The complete requests so far, byte for byte.
    std::vector<std::string> Requests() const;

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
