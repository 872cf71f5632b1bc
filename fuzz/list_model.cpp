#include "list_model.h"

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <initializer_list>
#include <memory>
#include <optional>
#include <vector>

#include <openssl/err.h>
#include <openssl/x509_vfy.h>
#include <openssl/x509v3.h>

#include <tarnik/core/ref.h>
#include <tarnik/crypto/certificate.h>

#include "certificate_values.h"
#include "fixed_random.h"
#include "input.h"
#include "support/test_certificates.h"

namespace Fuzz {
namespace {

using namespace Tarnik;
using Extensions = STACK_OF(X509_EXTENSION);

constexpr int kMostExtensions = 32;
constexpr int kLongestSerial = 64;
constexpr int kMostProbes = 4;

// RFC 5280, sections 4.2.1.1, 5.2.3, 5.2.4, 5.2.5, 5.3.1, 5.3.2 and 5.3.3.
constexpr char kAuthorityKey[] = "2.5.29.35";
constexpr char kListNumber[] = "2.5.29.20";
constexpr char kDeltaList[] = "2.5.29.27";
constexpr char kDistributionPoint[] = "2.5.29.28";
constexpr char kReason[] = "2.5.29.21";
constexpr char kInvalidityDate[] = "2.5.29.24";
constexpr char kOtherIssuer[] = "2.5.29.29";

bool IsOf(const X509_EXTENSION* extension, const char* type) {
  const OpenSsl::Owned<ASN1_OBJECT, ASN1_OBJECT_free> object(OBJ_txt2obj(type, 1));
  auto* const own = const_cast<X509_EXTENSION*>(extension);
  return OBJ_cmp(X509_EXTENSION_get_object(own), object.get()) == 0;
}

std::vector<X509_EXTENSION*> AllOf(const Extensions* extensions) {
  std::vector<X509_EXTENSION*> all;
  for (int i = 0; i < sk_X509_EXTENSION_num(extensions); ++i) {
    all.push_back(sk_X509_EXTENSION_value(extensions, i));
  }
  return all;
}

bool IsTwiceIn(const std::vector<X509_EXTENSION*>& all, X509_EXTENSION* extension) {
  return std::count_if(all.begin(), all.end(), [extension](X509_EXTENSION* other) {
           return OBJ_cmp(X509_EXTENSION_get_object(extension), X509_EXTENSION_get_object(other)) ==
                  0;
         }) > 1;
}

// What is critical has to be understood; the excluded ones may not even be uncritical.
bool AreUsable(const std::vector<X509_EXTENSION*>& all,
               std::initializer_list<const char*> understood,
               std::initializer_list<const char*> excluded) {
  return all.size() <= kMostExtensions &&
         std::all_of(all.begin(), all.end(), [&](X509_EXTENSION* extension) {
           const auto isOf = [extension](const char* type) { return IsOf(extension, type); };
           return !IsTwiceIn(all, extension) &&
                  std::none_of(excluded.begin(), excluded.end(), isOf) &&
                  (X509_EXTENSION_get_critical(extension) == 0 ||
                   std::any_of(understood.begin(), understood.end(), isOf));
         });
}

bool IsAuthorityKey(X509_EXTENSION* extension) {
  const OpenSsl::Owned<AUTHORITY_KEYID, AUTHORITY_KEYID_free> key(
      static_cast<AUTHORITY_KEYID*>(X509V3_EXT_d2i(extension)));
  return key != nullptr;
}

bool IsReasonToKeep(X509_EXTENSION* extension) {
  constexpr std::int64_t kRemoveFromList = 8;
  const OpenSsl::Owned<ASN1_ENUMERATED, ASN1_ENUMERATED_free> reason(
      static_cast<ASN1_ENUMERATED*>(X509V3_EXT_d2i(extension)));
  std::int64_t number = 0;
  return reason != nullptr && ASN1_ENUMERATED_get_int64(&number, reason.get()) == 1 &&
         number != kRemoveFromList;
}

bool IsTime(const ASN1_TIME* time) {
  return time != nullptr && ASN1_TIME_to_tm(time, nullptr) == 1;
}

bool IsUsableEntry(const X509_REVOKED* entry) {
  const auto extensions = AllOf(X509_REVOKED_get0_extensions(entry));
  const OpenSsl::OwnedBigNumber serial(
      ASN1_INTEGER_to_BN(X509_REVOKED_get0_serialNumber(entry), nullptr));
  return BN_num_bytes(serial.get()) <= kLongestSerial &&
         IsTime(X509_REVOKED_get0_revocationDate(entry)) &&
         AreUsable(extensions, {kReason, kInvalidityDate}, {kOtherIssuer}) &&
         std::all_of(extensions.begin(), extensions.end(), [](X509_EXTENSION* extension) {
           return !IsOf(extension, kReason) || IsReasonToKeep(extension);
         });
}

std::vector<X509_REVOKED*> EntriesOf(X509_CRL* list) {
  const STACK_OF(X509_REVOKED)* const entries = X509_CRL_get_REVOKED(list);
  std::vector<X509_REVOKED*> all;
  for (int i = 0; i < sk_X509_REVOKED_num(entries); ++i) {
    all.push_back(sk_X509_REVOKED_value(entries, i));
  }
  return all;
}

// RFC 5280, section 5.1.2.1.
bool HasKnownVersion(const X509_CRL* list) {
  const long version = X509_CRL_get_version(list);
  return version == X509_CRL_VERSION_1 || version == X509_CRL_VERSION_2;
}

bool HasPeriod(const X509_CRL* list) {
  const ASN1_TIME* const from = X509_CRL_get0_lastUpdate(list);
  const ASN1_TIME* const until = X509_CRL_get0_nextUpdate(list);
  return IsTime(from) && IsTime(until) && SecondsOf(from) <= SecondsOf(until);
}

bool IsUsable(X509_CRL* list) {
  const auto extensions = AllOf(X509_CRL_get0_extensions(list));
  const auto entries = EntriesOf(list);
  const OpenSsl::OwnedBio sink(BIO_new(BIO_s_null()));
  const X509_NAME* const issuer = X509_CRL_get_issuer(list);
  return HasKnownVersion(list) && X509_NAME_entry_count(issuer) > 0 &&
         X509_NAME_print_ex(sink.get(), issuer, 0, XN_FLAG_RFC2253) >= 0 && HasPeriod(list) &&
         AreUsable(extensions, {kAuthorityKey, kListNumber}, {kDeltaList, kDistributionPoint}) &&
         std::all_of(extensions.begin(), extensions.end(),
                     [](X509_EXTENSION* extension) {
                       return !IsOf(extension, kAuthorityKey) || IsAuthorityKey(extension);
                     }) &&
         std::all_of(entries.begin(), entries.end(), IsUsableEntry);
}

OpenSsl::OwnedCrl Decode(std::string_view der) {
  const unsigned char* position = BytesOf(der);
  OpenSsl::OwnedCrl list(d2i_X509_CRL(nullptr, &position, static_cast<long>(der.size())));
  const bool isWhole = list != nullptr && position == BytesOf(der) + der.size();
  ERR_clear_error();
  return isWhole ? std::move(list) : nullptr;
}

Ref<const Crypto::Certificate> ToOurs(const X509* certificate) {
  unsigned char* bytes = nullptr;
  const int length = i2d_X509(certificate, &bytes);
  const OpenSsl::OwnedMemory<unsigned char> owner(bytes);
  Require(length > 0);
  return Crypto::CreateCertificateFromDer(bytes, static_cast<std::size_t>(length));
}

// An authority, once without a keyUsage and twice with one.
struct Authority {
  OpenSsl::OwnedKey key;
  std::vector<OpenSsl::OwnedCertificate> certificates;
};

OpenSsl::OwnedCertificate NewCertificate(EVP_PKEY* key, const char* name) {
  const auto der = Testing::MakeCertificateDer({.key = key, .commonName = name});
  const unsigned char* position = der.data();
  OpenSsl::OwnedCertificate made(d2i_X509(nullptr, &position, static_cast<long>(der.size())));
  Require(made != nullptr);
  return made;
}

void AddExtension(X509* certificate, int number, const char* value) {
  X509V3_CTX context;
  X509V3_set_ctx(&context, certificate, certificate, nullptr, nullptr, 0);
  const OpenSsl::Owned<X509_EXTENSION, X509_EXTENSION_free> extension(
      X509V3_EXT_conf_nid(nullptr, &context, number, value));
  Require(X509_add_ext(certificate, extension.get(), -1) == 1);
}

const Authority& TheAuthority() {
  static const Authority authority = [] {
    FixRandomness(3);
    Authority made;
    made.key = Testing::MakeEcKey("P-256");
    for (const char* usage : {"", "keyCertSign", "keyCertSign,cRLSign"}) {
      OpenSsl::OwnedCertificate certificate = NewCertificate(made.key.get(), "signer");
      AddExtension(certificate.get(), NID_basic_constraints, "critical,CA:TRUE");
      AddExtension(certificate.get(), NID_subject_key_identifier, "hash");
      if (*usage != '\0') {
        AddExtension(certificate.get(), NID_key_usage, usage);
      }
      Require(X509_sign(certificate.get(), made.key.get(), EVP_sha256()) > 0);
      made.certificates.push_back(std::move(certificate));
    }
    return made;
  }();
  return authority;
}

// A certificate of the authority with this number, but not its signature.
OpenSsl::OwnedCertificate CertificateWith(const ASN1_INTEGER* serial) {
  static const OpenSsl::OwnedCertificate original = NewCertificate(TheAuthority().key.get(), "end");
  OpenSsl::OwnedCertificate made(X509_dup(original.get()));
  auto* const own = const_cast<ASN1_INTEGER*>(serial);
  Require(X509_set_serialNumber(made.get(), own) == 1);
  return made;
}

struct FreeStackOnly {
  void operator()(STACK_OF(X509_CRL) * lists) const noexcept { sk_X509_CRL_free(lists); }
};

/// What the validation of a chain that has to have a list says.
int Validate(X509* certificate, X509* authority, X509_CRL* list) {
  const OpenSsl::OwnedTrustStore store(X509_STORE_new());
  const OpenSsl::Owned<X509_STORE_CTX, X509_STORE_CTX_free> context(X509_STORE_CTX_new());
  const std::unique_ptr<STACK_OF(X509_CRL), FreeStackOnly> lists(sk_X509_CRL_new_null());
  Require(X509_STORE_add_cert(store.get(), authority) == 1 &&
          sk_X509_CRL_push(lists.get(), list) == 1 &&
          X509_STORE_CTX_init(context.get(), store.get(), certificate, nullptr) == 1);
  X509_STORE_CTX_set0_crls(context.get(), lists.get());
  X509_STORE_CTX_set_flags(context.get(), X509_V_FLAG_CRL_CHECK | X509_V_FLAG_NO_CHECK_TIME);
  X509_verify_cert(context.get());
  ERR_clear_error();
  return X509_STORE_CTX_get_error(context.get());
}

// A number that is listed twice is revoked since the earlier time.
std::optional<long> RevokedSince(X509_CRL* list, const ASN1_INTEGER* serial) {
  std::optional<long> since;
  for (const X509_REVOKED* const entry : EntriesOf(list)) {
    if (ASN1_INTEGER_cmp(X509_REVOKED_get0_serialNumber(entry), serial) == 0) {
      const long time = SecondsOf(X509_REVOKED_get0_revocationDate(entry));
      since = since ? std::min(*since, time) : time;
    }
  }
  return since;
}

bool IsSince(const boost::optional<System::DateTime>& ours, const std::optional<long>& seconds) {
  constexpr long kSecond = 1'000'000;
  return ours.has_value() == seconds.has_value() &&
         (!ours || ours->GetUtcTime() == *seconds * kSecond);
}

// A certificate whose issuer the list names.
void CompareCovered(const Crypto::RevocationList& ours, X509_CRL* list,
                    const ASN1_INTEGER* serial) {
  const OpenSsl::OwnedCertificate covered = CertificateWith(serial);
  Require(X509_set_issuer_name(covered.get(), X509_CRL_get_issuer(list)) == 1);
  i2d_re_X509_tbs(covered.get(), nullptr);
  const auto certificate = ToOurs(covered.get());
  Require(ours.Covers(*certificate));
  Require(IsSince(ours.RevokedSince(*certificate), RevokedSince(list, serial)));
}

void CompareValidation(const Crypto::RevocationList& ours, X509_CRL* list,
                       const ASN1_INTEGER* serial) {
  const Authority& known = TheAuthority();
  const OpenSsl::OwnedCertificate issued = CertificateWith(serial);
  Require(X509_sign(issued.get(), known.key.get(), EVP_sha256()) > 0);
  const auto certificate = ToOurs(issued.get());
  for (const OpenSsl::OwnedCertificate& authority : known.certificates) {
    const int verdict = Validate(issued.get(), authority.get(), list);
    const bool isUsed = verdict == X509_V_OK || verdict == X509_V_ERR_CERT_REVOKED;
    Require(ours.IsFrom(*ToOurs(authority.get())) == isUsed);
    if (isUsed) {
      Require(ours.RevokedSince(*certificate).has_value() == (verdict == X509_V_ERR_CERT_REVOKED));
    }
  }
}

// Those of the first entries, and the one after the first.
std::vector<OpenSsl::Owned<ASN1_INTEGER, ASN1_INTEGER_free>> SerialsOf(X509_CRL* list) {
  std::vector<OpenSsl::Owned<ASN1_INTEGER, ASN1_INTEGER_free>> serials;
  for (const X509_REVOKED* const entry : EntriesOf(list)) {
    if (serials.size() == kMostProbes) {
      break;
    }
    serials.emplace_back(ASN1_INTEGER_dup(X509_REVOKED_get0_serialNumber(entry)));
  }
  const OpenSsl::OwnedBigNumber next(
      serials.empty() ? BN_new() : ASN1_INTEGER_to_BN(serials.front().get(), nullptr));
  BN_add_word(next.get(), 1);
  if (BN_num_bytes(next.get()) <= kLongestSerial) {
    serials.emplace_back(BN_to_ASN1_INTEGER(next.get(), nullptr));
  }
  return serials;
}

}  // namespace

OpenSsl::OwnedCrl ReadUsableList(std::string_view der) {
  OpenSsl::OwnedCrl list = Decode(der);
  const bool isUsable = list != nullptr && IsUsable(list.get());
  ERR_clear_error();
  return isUsable ? std::move(list) : nullptr;
}

void CompareList(const Crypto::RevocationList& ours, std::string_view der) {
  constexpr long kSecond = 1'000'000;
  const OpenSsl::OwnedCrl list = Decode(der);
  Require(list != nullptr);
  X509_CRL* const theirs = list.get();
  Require(ours.IssuerName() == TextOf(X509_CRL_get_issuer(theirs)));
  Require(ours.ThisUpdate().GetUtcTime() == SecondsOf(X509_CRL_get0_lastUpdate(theirs)) * kSecond);
  Require(ours.NextUpdate().GetUtcTime() == SecondsOf(X509_CRL_get0_nextUpdate(theirs)) * kSecond);
  const auto serials = SerialsOf(theirs);
  for (const auto& serial : serials) {
    CompareCovered(ours, theirs, serial.get());
  }
  CompareValidation(ours, theirs, serials.front().get());
}

std::string SignedList(std::string_view der) {
  const OpenSsl::OwnedCrl list = Decode(der);
  if (list == nullptr || X509_CRL_sign(list.get(), TheAuthority().key.get(), EVP_sha256()) <= 0) {
    ERR_clear_error();
    return std::string(der);
  }
  unsigned char* bytes = nullptr;
  const int length = i2d_X509_CRL(list.get(), &bytes);
  const OpenSsl::OwnedMemory<unsigned char> owner(bytes);
  ERR_clear_error();
  return {reinterpret_cast<const char*>(bytes), static_cast<std::size_t>(std::max(length, 0))};
}

}  // namespace Fuzz
