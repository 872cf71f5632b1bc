#ifndef TARNIK_SSL_SSL_CONTEXT_H
#define TARNIK_SSL_SSL_CONTEXT_H

#include <functional>
#include <string>
#include <vector>

#include <tarnik/core/ref.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/crypto/private_key.h>
#include <tarnik/system/stream.h>

namespace Tarnik::Ssl {

/// A TLS connection over another stream. `Close` closes the stream below. A read that meets the end
/// of the stream below without the peer's close_notify fails with an `SSLException`: cut-off data
/// is never taken for all of it (RFC 8446, section 6.1).
class TARNIK_EXPORT SSLStream : public System::Stream {
 public:
  using HandshakeCompletion = std::function<void(Exception* error)>;

  /// Runs the client's side of the handshake. The peer must present a certificate that the context
  /// trusts and that names `serverName`, or `host` if `serverName` is empty: a DNS name or an IP
  /// address of its subjectAltName (RFC 6125; the subject's common name does not count). A name,
  /// not an address, is sent as SNI. Called once, before any read or write.
  virtual void HandshakeClientAsync(const std::string& host, const std::string& serverName,
                                    HandshakeCompletion completion) = 0;
};

/// Trust and sessions shared by TLS connections. Immutable; safe from many threads. TLS 1.2 and 1.3
/// only. Sessions are resumed towards the same host, port-independent, and server name alone.
class TARNIK_EXPORT SSLContext : public virtual Object {
 public:
  /// A TLS stream over `stream`. `name` is a label for diagnostics and may be empty.
  virtual Ref<SSLStream> WrapStream(System::Stream* stream, const std::string& name) = 0;
};

/// Whom to trust, and who to be. With nothing set, no peer is trusted and no certificate is shown.
struct SSLContextConfig {
  /// Files of PEM CA certificates.
  std::vector<std::string> caFiles;
  /// Folders of CA certificates under their subject hash names.
  std::vector<std::string> caFolders;
  /// CA certificates in memory.
  std::vector<Ref<const Crypto::Certificate>> caCertificates;
  /// Trust the CAs of the operating system.
  bool useSystemStore = false;
  /// Files of PEM certificate revocation lists. If any is given, every certificate of a peer's
  /// chain is checked, and one whose issuer's list is missing or out of date is refused.
  std::vector<std::string> crlFiles;
  /// If not empty, the peer's own certificate must also equal one of these byte for byte.
  std::vector<Ref<const Crypto::Certificate>> pinnedCertificates;
  /// Shown to a peer that asks for a certificate, with proof that `clientPrivateKey` is at hand.
  /// Both are set or neither. A key in a device serves here only if its provider gives the public
  /// half to no other provider: TLS would try to sign with that.
  Ref<const Crypto::Certificate> clientCertificate;
  Ref<const Crypto::PrivateKey> clientPrivateKey;
  /// Sent behind `clientCertificate`: its issuers, each behind the one that it has issued.
  std::vector<Ref<const Crypto::Certificate>> clientCertificateChain;
};

/// Throws `SSLException` when something that `config` names cannot be loaded (naming the file), and
/// when the client's key does not belong to its certificate, one of them is set without the other,
/// or TLS cannot use them; `InvalidArgumentException` when a certificate of a list is null.
TARNIK_EXPORT Ref<SSLContext> CreateSSLContext(const SSLContextConfig& config);

}  // namespace Tarnik::Ssl

#endif
