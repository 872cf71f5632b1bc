#ifndef SSOCLIENT_ACCESS_TRUST_TRUST_BUILDER_H
#define SSOCLIENT_ACCESS_TRUST_TRUST_BUILDER_H

#include <memory>
#include <set>
#include <string>
#include <utility>
#include <vector>

#include <ssoclient/access/trust_store.h>
#include <tarnik/crypto/digest.h>

#include "trust/trust_files.h"
#include "trust/trust_snapshot.h"

namespace SsoClient::Access {

/// The trust of some contents of files. Immutable.
struct Trust {
  TrustSnapshot snapshot;
  /// Of each issuer of the configuration, in its order.
  std::vector<TrustedSigner> signers;
  std::vector<std::string> issuersWithoutSigners;  ///< as in `TrustDescription`
  /// The issuer and the fingerprint of each of them.
  std::set<std::pair<std::string, Tarnik::Crypto::Sha256Digest>> identities;
  std::string digest;  ///< `TrustContents::digest`
};

/// Decodes `contents`, the files of `issuers`. Throws `Tarnik::Crypto::CryptoException`, with the
/// name of the file, when
///  - a file contains no certificate or list, or one that cannot be decoded,
///  - the key of a certificate cannot be used, or
///  - a list was not signed by a list signer or a certificate of its entry.
std::shared_ptr<const Trust> BuildTrust(const std::vector<TrustedIssuer>& issuers,
                                        const TrustContents& contents);

}  // namespace SsoClient::Access

#endif
