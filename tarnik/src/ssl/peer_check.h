#ifndef TARNIK_SSL_PEER_CHECK_H
#define TARNIK_SSL_PEER_CHECK_H

#include <tarnik/crypto/certificate.h>
#include <string>
#include <vector>

#include "support/openssl.h"

namespace Tarnik::Ssl {

using PinnedCertificates = std::vector<Ref<const Crypto::Certificate>>;

/// Whom one connection expects at its other end, and why the peer was not accepted. Used by one
/// thread at a time; must outlive the connection.
class PeerCheck {
 public:
  /// `expected` is a DNS name or an address; `pinned` must outlive this object and may be empty.
  PeerCheck(const std::string& expected, const PinnedCertificates& pinned);

  /// Makes `ssl` ask for its peer by SNI if it is named, and compare that name or address with the
  /// peer's certificate.
  void ApplyTo(SSL* ssl) const;

  /// Looks once more at the outcome of a handshake that has ended; so judges also what a resumed
  /// session has brought along. False when the peer is not the expected one.
  bool IsAccepted(const SSL* ssl);

  /// Why the peer was refused; empty when it was not.
  const std::string& Failure() const noexcept { return failure_; }

  /// To be called on each step of a verification, with OpenSSL's judgement; returns the final one.
  bool OnVerified(bool isValid, X509_STORE_CTX* context);

 private:
  bool IsPinned(X509* certificate) const;
  std::string DescribeFailure(int error, X509* certificate) const;

  const std::string expected_;
  const PinnedCertificates& pinned_;
  std::string failure_;
};

}  // namespace Tarnik::Ssl

#endif
