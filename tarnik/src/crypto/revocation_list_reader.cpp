#include "crypto/revocation_list_reader.h"

#include <algorithm>
#include <climits>
#include <cstdint>
#include <initializer_list>
#include <utility>

#include <openssl/asn1.h>
#include <openssl/objects.h>

#include <tarnik/crypto/crypto_exception.h>

#include "crypto/x509_values.h"
#include "support/openssl_error.h"

namespace Tarnik::Crypto {
namespace {

using Extensions = STACK_OF(X509_EXTENSION);

// Usual lists have three extensions, entries one. Each is compared with all others.
constexpr int kMaxExtensions = 32;
// That of certificates that this library decodes.
constexpr int kMaxListedSerialBytes = 64;

OpenSsl::OwnedCrl DecodeList(const std::vector<unsigned char>& der) {
  const OpenSsl::ErrorScope errors;
  if (der.empty()) {
    throw CryptoException("A revocation list cannot be empty.");
  }
  if (der.size() > INT_MAX) {
    throw CryptoException("The revocation list is too long.");
  }
  const unsigned char* position = der.data();
  OpenSsl::OwnedCrl list(d2i_X509_CRL(nullptr, &position, static_cast<long>(der.size())));
  if (list == nullptr) {
    throw CryptoException(errors.Describe("The revocation list cannot be decoded"));
  }
  if (position != der.data() + der.size()) {
    throw CryptoException("The revocation list is followed by other bytes.");
  }
  return list;
}

[[noreturn]] void ThrowBrokenList(const OpenSsl::ErrorScope& errors, const char* part) {
  throw CryptoException(
      errors.Describe(std::string("The revocation list's ") + part + " cannot be decoded"));
}

System::DateTime ListTime(const ASN1_TIME* time, const char* part) {
  const OpenSsl::ErrorScope errors;
  const std::optional<System::DateTime> instant = InstantOf(time);
  if (!instant) {
    ThrowBrokenList(errors, part);
  }
  return *instant;
}

std::string ListIssuerName(const X509_NAME* name) {
  const OpenSsl::ErrorScope errors;
  // RFC 5280, section 5.1.2.3.
  if (X509_NAME_entry_count(name) == 0) {
    throw CryptoException("The revocation list names no issuer.");
  }
  std::optional<std::string> text = TextOfName(name);
  if (!text) {
    ThrowBrokenList(errors, "issuer name");
  }
  return std::move(*text);
}

bool Has(const Extensions* extensions, int number) {
  return X509v3_get_ext_by_NID(extensions, number, -1) >= 0;
}

bool IsRepeated(const Extensions* extensions, int index) {
  const ASN1_OBJECT* type = X509_EXTENSION_get_object(sk_X509_EXTENSION_value(extensions, index));
  return X509v3_get_ext_by_OBJ(extensions, type, index) >= 0;
}

// RFC 5280, sections 4.2, 5.2 and 5.3.
void CheckExtensions(const Extensions* extensions, std::initializer_list<int> understood,
                     const std::string& owner) {
  const int count = sk_X509_EXTENSION_num(extensions);
  if (count > kMaxExtensions) {
    throw CryptoException(owner + " has more than " + std::to_string(kMaxExtensions) +
                          " extensions.");
  }
  for (int i = 0; i < count; ++i) {
    X509_EXTENSION* extension = sk_X509_EXTENSION_value(extensions, i);
    const int number = OBJ_obj2nid(X509_EXTENSION_get_object(extension));
    if (IsRepeated(extensions, i)) {
      throw CryptoException(owner + " has an extension twice.");
    }
    if (X509_EXTENSION_get_critical(extension) != 0 &&
        std::find(understood.begin(), understood.end(), number) == understood.end()) {
      throw CryptoException(owner + " has a critical extension that is not supported.");
    }
  }
}

// A list that leaves out certificates or reasons does not show that a certificate is not revoked.
void CheckListExtensions(const Extensions* extensions) {
  if (Has(extensions, NID_delta_crl)) {
    throw CryptoException("The revocation list is a delta list, which is not supported.");
  }
  if (Has(extensions, NID_issuing_distribution_point)) {
    throw CryptoException(
        "The revocation list has an issuingDistributionPoint: it may be indirect or not contain "
        "all certificates and reasons, which is not supported.");
  }
  CheckExtensions(extensions, {NID_authority_key_identifier, NID_crl_number},
                  "The revocation list");
}

OwnedAuthorityKey AuthorityKeyOf(const X509_CRL* list) {
  constexpr int kNoExtension = -1;
  const OpenSsl::ErrorScope errors;
  int critical = 0;
  OwnedAuthorityKey key(static_cast<AUTHORITY_KEYID*>(
      X509_CRL_get_ext_d2i(list, NID_authority_key_identifier, &critical, nullptr)));
  if (key == nullptr && critical != kNoExtension) {
    ThrowBrokenList(errors, "authority key identifier");
  }
  return key;
}

// removeFromCRL is only for delta lists (RFC 5280, section 5.3.1).
void CheckReason(const X509_REVOKED* entry) {
  constexpr std::int64_t kRemoveFromCrl = 8;
  const OpenSsl::ErrorScope errors;
  int critical = 0;
  const OpenSsl::Owned<ASN1_ENUMERATED, ASN1_ENUMERATED_free> reason(static_cast<ASN1_ENUMERATED*>(
      X509_REVOKED_get_ext_d2i(entry, NID_crl_reason, &critical, nullptr)));
  std::int64_t number = 0;
  if (reason == nullptr || ASN1_ENUMERATED_get_int64(&number, reason.get()) != 1) {
    ThrowBrokenList(errors, "reason of an entry");
  }
  if (number == kRemoveFromCrl) {
    throw CryptoException("The revocation list has an entry with the reason removeFromCRL.");
  }
}

void CheckEntryExtensions(const X509_REVOKED* entry) {
  const Extensions* extensions = X509_REVOKED_get0_extensions(entry);
  if (extensions == nullptr) {
    return;
  }
  if (Has(extensions, NID_certificate_issuer)) {
    throw CryptoException(
        "The revocation list has an entry of another issuer, which is not supported.");
  }
  CheckExtensions(extensions, {NID_crl_reason, NID_invalidity_date},
                  "An entry of the revocation list");
  if (Has(extensions, NID_crl_reason)) {
    CheckReason(entry);
  }
}

RevokedSerials RevokedIn(X509_CRL* list) {
  RevokedSerials revoked;
  const STACK_OF(X509_REVOKED)* entries = X509_CRL_get_REVOKED(list);
  for (int i = 0; i < sk_X509_REVOKED_num(entries); ++i) {
    const X509_REVOKED* entry = sk_X509_REVOKED_value(entries, i);
    const ASN1_INTEGER* serial = X509_REVOKED_get0_serialNumber(entry);
    if (ASN1_STRING_length(serial) > kMaxListedSerialBytes) {
      throw CryptoException("The revocation list has a serial number of more than " +
                            std::to_string(kMaxListedSerialBytes) + " bytes.");
    }
    CheckEntryExtensions(entry);
    revoked.Add(SerialKeyOf(serial),
                ListTime(X509_REVOKED_get0_revocationDate(entry), "revocation date of an entry"));
  }
  revoked.Sort();
  return revoked;
}

}  // namespace

RevocationListContent ReadRevocationList(const std::vector<unsigned char>& der) {
  const OpenSsl::OwnedCrl owner = DecodeList(der);
  X509_CRL* const list = owner.get();
  const long version = X509_CRL_get_version(list);
  if (version != X509_CRL_VERSION_1 && version != X509_CRL_VERSION_2) {
    throw CryptoException("The revocation list has an unknown version.");
  }
  CheckListExtensions(X509_CRL_get0_extensions(list));
  RevocationListContent content;
  content.issuerName = ListIssuerName(X509_CRL_get_issuer(list));
  content.issuer = DistinguishedName(X509_CRL_get_issuer(list));
  content.thisUpdate = ListTime(X509_CRL_get0_lastUpdate(list), "thisUpdate");
  if (X509_CRL_get0_nextUpdate(list) == nullptr) {
    throw CryptoException("The revocation list has no nextUpdate.");
  }
  content.nextUpdate = ListTime(X509_CRL_get0_nextUpdate(list), "nextUpdate");
  if (content.nextUpdate < content.thisUpdate) {
    throw CryptoException("The revocation list's nextUpdate is before its thisUpdate.");
  }
  content.revoked = RevokedIn(list);
  content.authorityKey = AuthorityKeyOf(list);
  content.signature = ReadListSignature(list, der);
  return content;
}

}  // namespace Tarnik::Crypto
