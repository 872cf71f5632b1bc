#ifndef TARNIK_CRYPTO_LIST_SIGNATURE_H
#define TARNIK_CRYPTO_LIST_SIGNATURE_H

#include <optional>
#include <vector>

#include "crypto/hash.h"
#include "crypto/signature_scheme.h"
#include "support/openssl.h"

namespace Tarnik::Crypto {

/// The signature of a revocation list (RFC 5280, section 5.1.1).
struct ListSignature {
  std::vector<unsigned char> digest;  ///< of the part that is signed
  std::vector<unsigned char> value;
  SignatureScheme scheme;
  Hash hash;
};

/// The signature of `list`, which was decoded from `der`. None when its algorithm is not supported,
/// or the signed part contains another one. Throws `CryptoException` when the digest cannot be
/// computed.
std::optional<ListSignature> ReadListSignature(const X509_CRL* list,
                                               const std::vector<unsigned char>& der);

}  // namespace Tarnik::Crypto

#endif
