#ifndef TARNIK_XML_SECURITY_TRUSTED_CERTIFICATES_H
#define TARNIK_XML_SECURITY_TRUSTED_CERTIFICATES_H

#include <array>
#include <cstddef>
#include <memory>
#include <string>
#include <vector>

#include <tarnik/core/ref.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/xml/security/key_hints.h>
#include <tarnik/xml/security/key_info.h>

#include "crypto/certificate_impl.h"
#include "crypto/hash.h"

namespace Tarnik::Xml::Security {

/// Certificates that a caller trusts, and how hints in messages name them. A hint that cannot be
/// read names none of them. Thread-safe.
class TrustedCertificates {
 public:
  using CertificateList = std::vector<Ref<const Crypto::Certificate>>;
  using Keys = std::vector<Ref<const Crypto::PublicKey>>;

  /// Throws `InvalidArgumentException` when the list is empty or contains null.
  explicit TrustedCertificates(CertificateList certificates);

  /// The different keys of the certificates that `keyInfo` names by the first kind of hint that is
  /// present, in the order of the list: see `CreateTrustedCertificatesResolver`. Throws
  /// `CryptoException` when it names a single certificate whose key cannot be used.
  Keys NamedBy(const KeyInfo& keyInfo) const;
  /// The certificates of these keys that `keyInfo` names. Throws as above.
  CertificateList CertificatesNamedBy(const KeyInfo& keyInfo) const;
  /// As `NamedBy`, but only by issuer and serial number. If `keyInfo` has no such hint, uses those
  /// of its first certificate.
  Keys NamedByIssuer(const KeyInfo& keyInfo) const;

 private:
  using Bytes = std::vector<unsigned char>;

  struct Trusted {
    Ref<const Crypto::Certificate> certificate;
    Ref<const Crypto::CertificateImpl> decoded;  ///< null if its bytes cannot be decoded
    std::size_t key;                             ///< its place in `keys_`
    Bytes identity;                              ///< what its key is compared by; may be empty
  };
  using Selection = std::vector<const Trusted*>;

  void CollectKeys();
  Selection SelectBy(const KeyInfo& keyInfo) const;
  Selection SelectByKeyHints(const KeyHints& hints) const;
  template <class Matches>
  Selection Select(Matches matches) const;
  Selection SelectByCertificates(const std::vector<Bytes>& encodings) const;
  Selection SelectByIssuerSerials(const std::vector<KeyInfo::IssuerSerial>& hints) const;
  Selection SelectByIssuerOf(const Crypto::CertificateImpl& certificate) const;
  Selection SelectBySubjectNames(const std::vector<std::string>& hints) const;
  Selection SelectByKeyIdentifiers(const std::vector<Bytes>& hints) const;
  Selection SelectByDigests(const KeyHints& hints) const;
  Selection SelectByPublicKeys(const std::vector<Bytes>& hints) const;
  /// The digests of all certificates, in their order. Computed once, since that takes longer than
  /// comparing them.
  std::shared_ptr<const std::vector<Bytes>> DigestsOfAll(Crypto::Hash hash) const;
  Keys KeysOf(const Selection& selection) const;

  std::vector<Trusted> list_;
  /// Each key once, in the order of the list. Filled, as the members of `Trusted` for keys, if
  /// there are several certificates.
  Keys keys_;
  /// Under `ObjectLock(this)`; null until they are needed.
  mutable std::array<std::shared_ptr<const std::vector<Bytes>>, Crypto::kHashCount> digests_;
};

}  // namespace Tarnik::Xml::Security

#endif
