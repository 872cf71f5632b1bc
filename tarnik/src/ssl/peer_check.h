#ifndef TARNIK_SSL_PEER_CHECK_H
#define TARNIK_SSL_PEER_CHECK_H

#include <string>
#include <vector>

#include <tarnik/crypto/certificate.h>

#include "support/openssl.h"

namespace Tarnik::Ssl {

using PinnedCertificates = std::vector<Ref<const Crypto::Certificate>>;

/// Checks that the peer of one connection is the expected one, and describes why it was rejected.
/// Used by one thread at a time; must outlive the connection.
class PeerCheck {
 public:
  /// Expects the DNS name or address `serverName` or, if that is empty, `host`. `pinned` must
  /// outlive this object and may be empty.
  PeerCheck(const std::string& host, const std::string& serverName,
            const PinnedCertificates& pinned);

  /// Makes `ssl` compare the expected name or address with the peer's certificate, and send a name
  /// as SNI.
  void ApplyTo(SSL* ssl) const;

  /// Checks the result of a completed handshake, so that resumed sessions are checked too. False
  /// when the peer is not the expected one.
  bool IsAccepted(const SSL* ssl);

  /// Why the peer was rejected; empty if it was not.
  const std::string& Failure() const noexcept { return failure_; }
  /// True when it was rejected because it is another peer.
  bool IsOtherPeer() const noexcept { return isOtherPeer_; }

  /// Called for each step of a verification with OpenSSL's result; returns the final result.
  bool OnVerified(bool isValid, X509_STORE_CTX* context);

 private:
  bool IsPinned(X509* certificate) const;
  bool Reject(int error, X509* certificate);
  std::string DescribeFailure(int error, X509* certificate) const;

  const std::string expected_;
  const PinnedCertificates& pinned_;
  std::string failure_;
  bool isOtherPeer_ = false;
};

}  // namespace Tarnik::Ssl

#endif
