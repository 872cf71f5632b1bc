#ifndef SSOCLIENT_ACCESS_TRUST_TRUST_ENTRY_H
#define SSOCLIENT_ACCESS_TRUST_TRUST_ENTRY_H

#include <string>
#include <vector>

#include <ssoclient/access/trust_store.h>
#include <tarnik/core/ref.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/crypto/revocation_list.h>

#include "trust/trust_files.h"

namespace SsoClient::Access {

/// A `TrustedIssuer` with what its files contain.
struct TrustEntry {
  struct Found {
    Tarnik::Ref<const Tarnik::Crypto::Certificate> certificate;
    std::string path;  ///< empty if it was given as an object
  };

  std::string issuer;
  std::vector<Found> certificates;
  /// Signed by a list signer or a certificate of this entry.
  std::vector<Tarnik::Ref<const Tarnik::Crypto::RevocationList>> lists;
  bool isRevocationChecked = false;
};

/// Throws as `BuildTrust`.
TrustEntry DecodeEntry(const TrustedIssuer& issuer, const TrustContents::Entry& contents);

}  // namespace SsoClient::Access

#endif
