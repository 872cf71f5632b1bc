#ifndef FUZZ_LIST_MODEL_H
#define FUZZ_LIST_MODEL_H

#include <string>
#include <string_view>

#include <tarnik/crypto/revocation_list.h>

#include "support/openssl.h"

namespace Fuzz {

/// The list as OpenSSL reads it; null unless the bytes are exactly one, and it follows the rules of
/// `CreateRevocationListFromDer`.
Tarnik::OpenSsl::OwnedCrl ReadUsableList(std::string_view der);

/// Fails unless `ours` says what OpenSSL reads in the list and concludes from it. Of three
/// certificates of one authority, which differ in their keyUsage, the list is of those with which
/// OpenSSL uses it to validate a chain, and then revokes the certificates that OpenSSL refuses.
void CompareList(const Tarnik::Crypto::RevocationList& ours, std::string_view der);

/// The list, signed by that authority; the bytes themselves if they are none.
std::string SignedList(std::string_view der);

}  // namespace Fuzz

#endif
