#ifndef TARNIK_TESTS_SUPPORT_TEST_PKI_H
#define TARNIK_TESTS_SUPPORT_TEST_PKI_H

#include <ctime>
#include <string>
#include <vector>

#include <tarnik/crypto/certificate.h>

#include "support/openssl.h"

namespace Tarnik::Testing {

/// A certificate with its EC key.
struct Identity {
  OpenSsl::OwnedCertificate certificate;
  OpenSsl::OwnedKey key;

  std::string Pem() const;
  /// The private key, in PEM without encryption.
  std::string KeyPem() const;
  /// As a certificate of the library.
  Ref<const Crypto::Certificate> ToCertificate() const;
};

struct IdentityOptions {
  std::string commonName = "sts.example";
  /// Raw bytes of the dNSName entries, which may contain NUL.
  std::vector<std::string> dnsNames = {"sts.example"};
  std::vector<std::string> addresses = {};
  bool isCa = false;
  /// Seconds from now.
  long notBefore = -3600;
  long notAfter = 3600;
  /// For example "clientAuth"; none if empty.
  std::string extendedKeyUsage = "";
  /// The bits of an RSA key; 0 means a key on P-256.
  unsigned rsaBits = 0;
};

/// Issued by `issuer`, or self-signed if that is null.
Identity MakeIdentity(const IdentityOptions& options, const Identity* issuer);
Identity MakeCa(const std::string& commonName, const Identity* issuer = nullptr);
/// Another key on P-256, with a certificate that has all names, numbers and identifiers of
/// `original`; signed by itself.
Identity MakeLookalike(const Identity& original);
/// The key of `original` with another certificate that differs in its serial number.
Identity MakeRenewed(const Identity& original, const Identity& issuer);

/// A PEM revocation list of `issuer` that revokes `revoked`, or nothing if that is null.
/// `nextUpdate` and `thisUpdate` are in seconds from `now`.
std::string MakeCrl(const Identity& issuer, const Identity* revoked, long nextUpdate = 3600,
                    long thisUpdate = -3600, std::time_t now = std::time(nullptr));

}  // namespace Tarnik::Testing

#endif
