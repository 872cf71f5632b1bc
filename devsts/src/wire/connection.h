#ifndef DEVSTS_WIRE_CONNECTION_H
#define DEVSTS_WIRE_CONNECTION_H

#include <atomic>
#include <chrono>
#include <cstddef>
#include <optional>
#include <string>
#include <string_view>

#include "devsts/misbehavior.h"
#include "signing/openssl_handles.h"

namespace DevSts {

// One accepted connection, with or without TLS. Used by one thread; `Abort` alone may be called by
// others, and only before the object ends.
class Connection {
 public:
  // To be called once for each context that connections are made with.
  static void Prepare(SSL_CTX* tls);

  // Takes the socket. `tls` may be null.
  Connection(int socket, SSL_CTX* tls);
  ~Connection();
  Connection(const Connection&) = delete;
  Connection& operator=(const Connection&) = delete;

  // True at once without TLS.
  bool Handshake();
  // Octets read, 0 at the end or on any error.
  std::size_t Read(char* data, std::size_t size);
  bool Write(std::string_view octets);
  // True when the peer has closed or `Abort` was called, false when the time has passed.
  bool WaitForEnd(std::optional<std::chrono::milliseconds> limit);
  // Ends the sending side and waits a little for the peer, so that nothing sent is lost to a reset.
  void Finish(CutStyle style);
  // Makes every call of the connection's thread return.
  void Abort();

  bool OverTls() const { return tls_ != nullptr; }
  bool SessionReused() const;
  std::string TlsVersion() const;
  // The server_name extension as the peer sent it, also when it resumes a session.
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
