#ifndef TARNIK_SSL_TLS_ENGINE_H
#define TARNIK_SSL_TLS_ENGINE_H

#include <cstddef>
#include <optional>
#include <string>
#include <vector>

#include <tarnik/ssl/ssl_exception.h>

#include "ssl/peer_check.h"
#include "ssl/ssl_context_impl.h"
#include "support/openssl.h"

namespace Tarnik::Ssl {

/// The client's side of one TLS connection without its I/O: bytes from the peer go in, bytes for
/// the peer come out. Failures are `SSLException`s; after one, only `TakeOutput` may be called.
/// Used by one thread at a time; clears OpenSSL's error queue of that thread.
class TlsEngine {
 public:
  /// The peer must be `serverName`, or `host` if that is empty. Messages name it as `peer`.
  TlsEngine(Ref<SSLContextImpl> context, const std::string& host, const std::string& serverName,
            const std::string& peer);
  ~TlsEngine();
  TlsEngine(const TlsEngine&) = delete;
  TlsEngine& operator=(const TlsEngine&) = delete;

  /// Continues the handshake; true when it has succeeded, false when it needs more input.
  bool Handshake();
  /// Reads 1 to `size` bytes of data. Returns 0 at the peer's close_notify, and nothing when it
  /// needs more input.
  std::optional<std::size_t> Read(char* buffer, std::size_t size);
  /// Takes 1 to `size` bytes of data to send and returns how many.
  std::size_t Write(const char* data, std::size_t size);

  void Feed(const char* data, std::size_t size);
  std::size_t OutputSize() const;
  /// Moves all pending output to `taken`, replacing its content.
  void TakeOutput(std::vector<char>& taken);

  /// Throws the failure of the handshake or, after it, of a connection that was cut off without
  /// close_notify.
  [[noreturn]] void FailAtEndOfInput() const;
  SSLException HandshakeError(const std::string& cause) const;
  bool IsHandshakeDone() const noexcept { return isHandshakeDone_; }

  static void InstallCallbacks(SSL_CTX* context);

 private:
  static int OnVerified(int isValid, X509_STORE_CTX* context);
  static int OnNewSession(SSL* ssl, SSL_SESSION* session);

  void Resume();
  void ExamineStart(const char* data, std::size_t size);
  [[noreturn]] void Fail(const std::string& operation);
  [[noreturn]] void FailHandshake(const std::string& reason) const;
  std::string DescribeHandshake(const std::string& cause) const;

  const Ref<SSLContextImpl> context_;
  const std::string peer_;
  const std::string sessionPeer_;
  PeerCheck check_;
  OpenSsl::OwnedSsl ssl_;
  BIO* input_ = nullptr;   // owned by `ssl_`
  BIO* output_ = nullptr;  // owned by `ssl_`
  std::string start_;      // the first bytes of the peer, until they show whether it speaks TLS
  const char* notTls_ = nullptr;  // how the peer answers if it does not speak TLS
  bool isHandshakeDone_ = false;
  bool hasFailed_ = false;
};

}  // namespace Tarnik::Ssl

#endif
