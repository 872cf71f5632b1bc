#ifndef DEVSTS_WIRE_CONNECTION_H
#define DEVSTS_WIRE_CONNECTION_H

#include <chrono>
#include <cstddef>
#include <optional>
#include <string>
#include <string_view>

#include "devsts/misbehavior.h"
#include "signing/openssl_handles.h"

namespace DevSts {

// One accepted connection, with or without TLS. Used by one thread; only `Abort` may be called by
// other threads, during the lifetime of the object.
class Connection {
 public:
  // Must be called once for each context that connections use.
  static void Prepare(SSL_CTX* tls);

  // Takes ownership of the socket, unless it throws std::exception. `tls` may be null.
  Connection(int socket, SSL_CTX* tls);
  ~Connection();
  Connection(const Connection&) = delete;
  Connection& operator=(const Connection&) = delete;

  // Returns true at once without TLS.
  bool Handshake();
  // Returns the number of octets read, 0 at the end or on any error.
  std::size_t Read(char* data, std::size_t size);
  bool Write(std::string_view octets);
  // Returns true when the peer has closed the connection or `Abort` was called, false after the
  // time limit.
  bool WaitForEnd(std::optional<std::chrono::milliseconds> limit);
  // Ends the sending side and waits a few seconds for the peer, so that a reset does not discard
  // sent octets.
  void Finish(CutStyle style);
  // Makes pending and later calls in the connection's thread return.
  void Abort();

  bool OverTls() const { return tls_ != nullptr; }
  bool SessionReused() const;
  std::string TlsVersion() const;
  // The server_name extension that the peer sent, also in a resumed session.
  const std::string& ServerName() const { return serverName_; }
  std::string PeerCertificatePem() const;

 private:
  static int ReadServerName(SSL* tls, int* alert, void* context);
  void DrainUntilEnd();

  const int socket_;
  SslHandle tls_;
  std::string serverName_;
};

}  // namespace DevSts

#endif
