#include <chrono>
#include <memory>
#include <string>
#include <vector>

#include <openssl/pem.h>

#include "devsts/certificates.h"
#include "signing/openssl_handles.h"

namespace DevSts {
namespace {

using TimeHandle = std::unique_ptr<ASN1_TIME, FreeWith<ASN1_TIME_free>>;
using IntegerHandle = std::unique_ptr<ASN1_INTEGER, FreeWith<ASN1_INTEGER_free>>;
using EntryHandle = std::unique_ptr<X509_REVOKED, FreeWith<X509_REVOKED_free>>;
using ListExtensionHandle = std::unique_ptr<X509_EXTENSION, FreeWith<X509_EXTENSION_free>>;

void RequireListStep(bool done, const char* what) {
  if (!done) {
    ThrowOpenSslError(std::string("revocation list: ") + what);
  }
}

TimeHandle InSeconds(long long seconds) {
  TimeHandle time(X509_gmtime_adj(nullptr, static_cast<long>(seconds)));
  RequireListStep(time != nullptr, "time");
  return time;
}

void AddRevoked(X509_CRL* list, const std::string& certificatePem) {
  const CertificateHandle certificate = LoadCertificate(certificatePem);
  EntryHandle entry(X509_REVOKED_new());
  const TimeHandle now = InSeconds(0);
  RequireListStep(entry != nullptr &&
                      X509_REVOKED_set_serialNumber(
                          entry.get(), X509_get_serialNumber(certificate.get())) == 1 &&
                      X509_REVOKED_set_revocationDate(entry.get(), now.get()) == 1 &&
                      X509_CRL_add0_revoked(list, entry.get()) == 1,
                  "entry");
  static_cast<void>(entry.release());
}

// RFC 5280, sections 5.2.1 and 5.2.3. Milliseconds since 1970 grow without a memory of the last
// number.
void AddListExtensions(X509_CRL* list, X509* issuer) {
  X509V3_CTX context;
  X509V3_set_ctx(&context, issuer, nullptr, nullptr, list, 0);
  const ListExtensionHandle keyId(
      X509V3_EXT_conf_nid(nullptr, &context, NID_authority_key_identifier, "keyid:always"));
  RequireListStep(keyId != nullptr && X509_CRL_add_ext(list, keyId.get(), -1) == 1,
                  "key identifier");
  const auto sinceEpoch = std::chrono::system_clock::now().time_since_epoch();
  const IntegerHandle number(ASN1_INTEGER_new());
  RequireListStep(
      number != nullptr &&
          ASN1_INTEGER_set_int64(
              number.get(),
              std::chrono::duration_cast<std::chrono::milliseconds>(sinceEpoch).count()) == 1 &&
          X509_CRL_add1_ext_i2d(list, NID_crl_number, number.get(), 0, 0) == 1,
      "number");
}

std::string ListToPem(X509_CRL* list) {
  const BioHandle bio(BIO_new(BIO_s_mem()));
  RequireListStep(bio != nullptr && PEM_write_bio_X509_CRL(bio.get(), list) == 1, "writing");
  char* data = nullptr;
  const long size = BIO_get_mem_data(bio.get(), &data);
  return std::string(data, static_cast<std::size_t>(size));
}

}  // namespace

std::string MakeRevocationList(const Credential& issuer,
                               const std::vector<std::string>& revokedCertificatePems,
                               std::chrono::seconds validity) {
  const CertificateHandle certificate = LoadCertificate(issuer.certificatePem);
  const KeyHandle key = LoadPrivateKey(issuer.privateKeyPem);
  const RevocationListHandle list(X509_CRL_new());
  constexpr long kVersion2 = 1;
  RequireListStep(
      list != nullptr && X509_CRL_set_version(list.get(), kVersion2) == 1 &&
          X509_CRL_set_issuer_name(list.get(), X509_get_subject_name(certificate.get())) == 1 &&
          X509_CRL_set1_lastUpdate(list.get(), InSeconds(0).get()) == 1 &&
          X509_CRL_set1_nextUpdate(list.get(), InSeconds(validity.count()).get()) == 1,
      "content");
  for (const std::string& revoked : revokedCertificatePems) {
    AddRevoked(list.get(), revoked);
  }
  AddListExtensions(list.get(), certificate.get());
  RequireListStep(
      X509_CRL_sort(list.get()) == 1 && X509_CRL_sign(list.get(), key.get(), EVP_sha256()) > 0,
      "signing");
  return ListToPem(list.get());
}

}  // namespace DevSts
