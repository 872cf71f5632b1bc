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

/// A TLS connection over another stream. `Close` closes the stream below. When the stream below
/// ends without the peer's close_notify, a read fails with a `TruncationException`, so that
/// truncated data is never taken for complete data (RFC 8446, section 6.1). A shortage of memory on
/// an I/O thread fails the connection; what leaves a completion of the caller ends the process, and
/// a forked child cannot use the stream of its parent, as `Stream` says.
class TARNIK_EXPORT SSLStream : public System::Stream {
 public:
  /// Receives null, or why the handshake failed.
  using HandshakeCompletion = std::function<void(Exception* error)>;

  /// Runs the client's side of the handshake. The peer must present a certificate that the context
  /// trusts and whose subjectAltName contains `serverName`, or `host` if `serverName` is empty, as
  /// a DNS name or an IP address (RFC 6125; the common name of the subject does not count). A name,
  /// but not an address, is sent as SNI. Called once, before any read or write.
  virtual void HandshakeClientAsync(const std::string& host, const std::string& serverName,
                                    HandshakeCompletion completion) = 0;
};

/// Trust and sessions shared by TLS connections. Immutable; thread-safe. Supports TLS 1.3 and, with
/// ECDHE and AES-GCM or ChaCha20-Poly1305, TLS 1.2 (RFC 9325); neither OpenSSL's configuration file
/// nor the environment changes what is offered. Sessions are resumed only with the same host, on
/// any port, and the same server name.
class TARNIK_EXPORT SSLContext : public virtual Object {
 public:
  /// A TLS stream over `stream`. `name` is a label for diagnostics and may be empty.
  virtual Ref<SSLStream> WrapStream(System::Stream* stream, const std::string& name) = 0;
};

/// The trusted peers and the identity of the client. By default no peer is trusted and no
/// certificate is presented.
struct SSLContextConfig {
  /// PEM files of CA certificates.
  std::vector<std::string> caFiles;
  /// Folders of CA certificates whose file names are the hashes of their subjects.
  std::vector<std::string> caFolders;
  /// CA certificates in memory.
  std::vector<Ref<const Crypto::Certificate>> caCertificates;
  /// Trust the CAs of the operating system.
  bool useSystemStore = false;
  /// PEM files of certificate revocation lists. If there is any, every certificate of a peer's
  /// chain is checked, and a certificate whose issuer's list is missing or out of date is rejected.
  /// Of several lists of an issuer the newest by thisUpdate counts, since a newer list replaces the
  /// older ones (RFC 5280, section 5): a certificate that was only on hold may be missing from it.
  /// When several lists have that same date, a revocation in any of them counts.
  std::vector<std::string> crlFiles;
  /// If not empty, the peer's certificate must also equal one of these byte for byte.
  std::vector<Ref<const Crypto::Certificate>> pinnedCertificates;
  /// Presented to a peer that requests a certificate, with a signature by `clientPrivateKey`. Both
  /// are set or neither. A key in a device can be used only if its provider does not export the
  /// public half to another provider, since OpenSSL would then try to sign with that provider.
  Ref<const Crypto::Certificate> clientCertificate;
  /// The key of `clientCertificate`.
  Ref<const Crypto::PrivateKey> clientPrivateKey;
  /// Sent after `clientCertificate`: its issuers, each after the certificate that it issued.
  std::vector<Ref<const Crypto::Certificate>> clientCertificateChain;
};

/// Throws `SSLException` when a file or folder of `config` cannot be loaded (the message names it),
/// and when the client's key does not belong to its certificate, one of them is set without the
/// other, or TLS cannot use them; `InvalidArgumentException` when a certificate in a list is null.
TARNIK_EXPORT Ref<SSLContext> CreateSSLContext(const SSLContextConfig& config);

}  // namespace Tarnik::Ssl

#endif
