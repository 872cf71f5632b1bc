#ifndef SSOCLIENT_ACCESS_TRUST_TRUST_SNAPSHOT_H
#define SSOCLIENT_ACCESS_TRUST_TRUST_SNAPSHOT_H

#include <cstddef>
#include <cstdint>
#include <map>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include <ssoclient/access/trust_store.h>
#include <tarnik/core/ref.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/system/date_time.h>
#include <tarnik/xml/security/key_info.h>
#include <tarnik/xml/security/key_info_resolver.h>

namespace SsoClient::Access {

/// A trusted certificate, and what the revocation lists in use say about it.
struct Signer {
  Tarnik::Ref<const Tarnik::Crypto::Certificate> certificate;
  Tarnik::System::DateTime notBefore;
  Tarnik::System::DateTime notAfter;
  /// Trusts only this certificate.
  Tarnik::Ref<const Tarnik::Xml::Security::KeyInfoResolver> resolver;
  /// "CN=sts (SHA-256 AB:CD:EF:01:23:45:67:89...)"
  std::string name;
  /// The period of the list that covers the certificate; none without such a list.
  std::optional<Tarnik::System::DateTime> listFrom;
  std::optional<Tarnik::System::DateTime> listUntil;
  std::optional<Tarnik::System::DateTime> revokedSince;
  bool isRevocationChecked = false;
};

/// How many keys are tried for a signature that does not say which key has made it.
inline constexpr std::size_t kMostTried = 16;

/// The signers of one issuer.
struct IssuerTrust {
  std::vector<Signer> signers;
  /// Selects among the signers' certificates; null without signers.
  Tarnik::Ref<const Tarnik::Xml::Security::CertificateCandidatesResolver> resolver;

  /// The signers that a signature by `method` with `keyInfo` may have been made by. If there are
  /// more than `kMostTried`, those whose keys are of another type are left out.
  std::vector<const Signer*> Select(const Tarnik::Xml::Security::KeyInfo& keyInfo,
                                    std::string_view method) const;
};

/// The whole trust as it was read at one moment. Immutable; thread-safe.
class TrustSnapshot {
 public:
  TrustSnapshot(std::map<std::string, IssuerTrust, std::less<>> named, IssuerTrust others,
                std::uint64_t version);

  /// Who may sign the tokens of `issuer`, in the order of the configuration; null if nobody may.
  /// Valid as long as the snapshot.
  const IssuerTrust* Find(std::string_view issuer) const;
  /// The issuers of entries with an issuer whose tokens somebody may sign. Valid as long as the
  /// snapshot.
  std::vector<std::string_view> Issuers() const;
  /// Differs between the snapshots of all stores of the process.
  std::uint64_t Version() const noexcept { return version_; }

 private:
  /// The signers of entries with an issuer, with those of entries without one.
  std::map<std::string, IssuerTrust, std::less<>> named_;
  /// The signers of entries without an issuer.
  IssuerTrust others_;
  std::uint64_t version_;
};

}  // namespace SsoClient::Access

#endif
