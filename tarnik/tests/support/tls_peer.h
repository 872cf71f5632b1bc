#ifndef TARNIK_TESTS_SUPPORT_TLS_PEER_H
#define TARNIK_TESTS_SUPPORT_TLS_PEER_H

#include <cstddef>
#include <functional>
#include <string>
#include <thread>
#include <vector>

#include "support/loopback.h"
#include "support/openssl.h"
#include "support/test_pki.h"

namespace Tarnik::Testing {

/// How the server side of a TLS connection behaves. The server uses OpenSSL directly.
struct TlsPeerOptions {
  /// Null presents no certificate, as for anonymous suites.
  const Identity* identity = nullptr;
  /// Sent after the identity's own certificate.
  std::vector<const Identity*> chain = {};
  int minVersion = TLS1_2_VERSION;
  int maxVersion = TLS1_3_VERSION;
  std::string ciphers = "DEFAULT";
  int securityLevel = 2;
  /// The signature algorithms that it makes, in OpenSSL's names; OpenSSL's defaults if empty.
  std::string signatures = "";
  /// If set, the client must present a certificate issued by this CA.
  const Identity* clientCa = nullptr;
};

OpenSsl::OwnedSslContext MakeServerContext(const TlsPeerOptions& options);

/// A TLS server on the loopback interface that serves one connection at a time.
class TlsServer {
 public:
  struct Connection {
    bool accepted = false;
    bool resumed = false;
    std::string serverName;
    /// DER of the client's certificate; empty for none.
    std::string clientCertificate;
  };
  using Handler = std::function<void(SSL*)>;

  /// `serve` runs after each successful handshake; if empty, the server sends "hello" and closes
  /// gracefully.
  TlsServer(const TlsPeerOptions& options, int connections, Handler serve = {});
  ~TlsServer() { Join(); }
  TlsServer(const TlsServer&) = delete;
  TlsServer& operator=(const TlsServer&) = delete;

  int Port() const { return listener_.Port(); }
  /// Waits until all connections have been served; returns what the server has seen.
  const std::vector<Connection>& Join();

 private:
  void Serve(int connections);

  LoopbackListener listener_;
  OpenSsl::OwnedSslContext context_;
  Handler serve_;
  std::vector<Connection> served_;
  std::thread thread_;
};

/// Writes all of `data`; returns false if the peer has gone.
bool TlsWrite(SSL* ssl, const std::string& data);
std::string TlsReadExactly(SSL* ssl, std::size_t size);

}  // namespace Tarnik::Testing

#endif
