#ifndef SSOCLIENT_ACCESS_TRUST_TRUST_ENTRY_H
#define SSOCLIENT_ACCESS_TRUST_TRUST_ENTRY_H

#include <string>
#include <vector>

#include <ssoclient/access/trust_store.h>
#include <tarnik/core/ref.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/crypto/digest.h>
#include <tarnik/crypto/revocation_list.h>

#include "trust/trust_files.h"

namespace SsoClient::Access {

/// A `TrustedIssuer` with what its files contain.
struct TrustEntry {
  struct Found {
    Tarnik::Ref<const Tarnik::Crypto::Certificate> certificate;
    std::string path;  ///< empty if it was given as an object
  };

  struct FoundList {
    Tarnik::Ref<const Tarnik::Crypto::RevocationList> list;
    /// Of the list signer or certificate of the entry that has signed it.
    Tarnik::Crypto::Sha256Digest signer;
  };

  std::string issuer;
  std::vector<Found> certificates;
  std::vector<FoundList> lists;
  bool isRevocationChecked = false;
};

/// Throws as `BuildTrust`.
TrustEntry DecodeEntry(const TrustedIssuer& issuer, const TrustContents::Entry& contents);

}  // namespace SsoClient::Access

#endif
