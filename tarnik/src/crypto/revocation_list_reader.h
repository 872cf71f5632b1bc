#ifndef TARNIK_CRYPTO_REVOCATION_LIST_READER_H
#define TARNIK_CRYPTO_REVOCATION_LIST_READER_H

#include <optional>
#include <string>
#include <vector>

#include <tarnik/system/date_time.h>

#include "crypto/distinguished_name.h"
#include "crypto/list_signature.h"
#include "crypto/revoked_serials.h"
#include "support/openssl.h"

namespace Tarnik::Crypto {

using OwnedAuthorityKey = OpenSsl::Owned<AUTHORITY_KEYID, AUTHORITY_KEYID_free>;

/// What a revocation list says.
struct RevocationListContent {
  std::string issuerName;
  DistinguishedName issuer;
  System::DateTime thisUpdate;
  System::DateTime nextUpdate;
  RevokedSerials revoked;
  OwnedAuthorityKey authorityKey;  ///< null when the extension is absent
  std::optional<ListSignature> signature;
};

/// Reads a list in DER. Throws as `CreateRevocationListFromDer` does.
RevocationListContent ReadRevocationList(const std::vector<unsigned char>& der);

}  // namespace Tarnik::Crypto

#endif
