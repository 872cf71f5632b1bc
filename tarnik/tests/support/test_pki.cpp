#include "support/test_pki.h"

#include <cstddef>
#include <ctime>
#include <stdexcept>
#include <string>

#include <openssl/pem.h>
#include <openssl/rand.h>

#include <tarnik/crypto/certificate.h>

#include "support/openssl.h"

namespace Tarnik::Testing {
namespace {

void Require(bool condition) {
  if (!condition) {
    throw std::runtime_error("OpenSSL failed to make test data");
  }
}

std::string TakeText(BIO* bio) {
  char* text = nullptr;
  const long length = BIO_get_mem_data(bio, &text);
  return std::string(text, static_cast<std::size_t>(length));
}

void SetName(X509_NAME* name, const std::string& commonName) {
  Require(X509_NAME_add_entry_by_txt(name, "CN", MBSTRING_UTF8,
                                     reinterpret_cast<const unsigned char*>(commonName.data()),
                                     static_cast<int>(commonName.size()), -1, 0) == 1);
}

void SetSerialNumber(X509* certificate) {
  unsigned char bytes[8];
  Require(RAND_bytes(bytes, sizeof(bytes)) == 1);
  bytes[0] &= 0x7f;
  const OpenSsl::OwnedBigNumber number(BN_bin2bn(bytes, sizeof(bytes), nullptr));
  Require(BN_to_ASN1_INTEGER(number.get(), X509_get_serialNumber(certificate)) != nullptr);
}

void AddExtension(X509* certificate, X509* issuer, int nid, const std::string& value) {
  X509V3_CTX context;
  X509V3_set_ctx(&context, issuer, certificate, nullptr, nullptr, 0);
  const OpenSsl::Owned<X509_EXTENSION, X509_EXTENSION_free> extension(
      X509V3_EXT_conf_nid(nullptr, &context, nid, value.c_str()));
  Require(extension != nullptr && X509_add_ext(certificate, extension.get(), -1) == 1);
}

void Push(GENERAL_NAMES* names, int type, ASN1_STRING* value) {
  GENERAL_NAME* name = GENERAL_NAME_new();
  Require(name != nullptr && value != nullptr);
  GENERAL_NAME_set0_value(name, type, value);
  Require(sk_GENERAL_NAME_push(names, name) > 0);
}

void AddNames(X509* certificate, const IdentityOptions& options) {
  const OpenSsl::OwnedGeneralNames names(GENERAL_NAMES_new());
  for (const std::string& dnsName : options.dnsNames) {
    ASN1_IA5STRING* value = ASN1_IA5STRING_new();
    Require(ASN1_STRING_set(value, dnsName.data(), static_cast<int>(dnsName.size())) == 1);
    Push(names.get(), GEN_DNS, value);
  }
  for (const std::string& address : options.addresses) {
    Push(names.get(), GEN_IPADD, a2i_IPADDRESS(address.c_str()));
  }
  if (sk_GENERAL_NAME_num(names.get()) > 0) {
    Require(X509_add1_ext_i2d(certificate, NID_subject_alt_name, names.get(), 0, 0) == 1);
  }
}

// Required of revocation lists (RFC 5280, section 5.2.1).
void AddKeyIdentifier(X509_CRL* crl, X509* issuer) {
  X509V3_CTX context;
  X509V3_set_ctx(&context, issuer, nullptr, nullptr, crl, 0);
  const OpenSsl::Owned<X509_EXTENSION, X509_EXTENSION_free> extension(
      X509V3_EXT_conf_nid(nullptr, &context, NID_authority_key_identifier, "keyid:always"));
  Require(extension != nullptr && X509_CRL_add_ext(crl, extension.get(), -1) == 1);
}

EVP_PKEY* MakeKey(unsigned rsaBits) {
  return rsaBits == 0 ? EVP_EC_gen("P-256") : EVP_RSA_gen(rsaBits);
}

}  // namespace

std::string Identity::Pem() const {
  const OpenSsl::OwnedBio bio(BIO_new(BIO_s_mem()));
  Require(PEM_write_bio_X509(bio.get(), certificate.get()) == 1);
  return TakeText(bio.get());
}

std::string Identity::KeyPem() const {
  const OpenSsl::OwnedBio bio(BIO_new(BIO_s_mem()));
  Require(PEM_write_bio_PrivateKey(bio.get(), key.get(), nullptr, nullptr, 0, nullptr, nullptr) ==
          1);
  return TakeText(bio.get());
}

Ref<const Crypto::Certificate> Identity::ToCertificate() const {
  unsigned char* der = nullptr;
  const int length = i2d_X509(certificate.get(), &der);
  const OpenSsl::OwnedMemory<unsigned char> owner(der);
  Require(length > 0);
  return Crypto::CreateCertificateFromDer(der, static_cast<std::size_t>(length));
}

Identity MakeIdentity(const IdentityOptions& options, const Identity* issuer) {
  Identity made{OpenSsl::OwnedCertificate(X509_new()), OpenSsl::OwnedKey(MakeKey(options.rsaBits))};
  X509* certificate = made.certificate.get();
  X509* issuing = issuer == nullptr ? certificate : issuer->certificate.get();
  Require(made.key != nullptr && X509_set_version(certificate, X509_VERSION_3) == 1);
  SetSerialNumber(certificate);
  SetName(X509_get_subject_name(certificate), options.commonName);
  Require(X509_set_issuer_name(certificate, X509_get_subject_name(issuing)) == 1);
  X509_gmtime_adj(X509_getm_notBefore(certificate), options.notBefore);
  X509_gmtime_adj(X509_getm_notAfter(certificate), options.notAfter);
  Require(X509_set_pubkey(certificate, made.key.get()) == 1);
  AddExtension(certificate, issuing, NID_basic_constraints,
               options.isCa ? "critical,CA:TRUE" : "critical,CA:FALSE");
  if (options.isCa) {
    AddExtension(certificate, issuing, NID_key_usage, "critical,keyCertSign,cRLSign");
  }
  AddExtension(certificate, issuing, NID_subject_key_identifier, "hash");
  AddExtension(certificate, issuing, NID_authority_key_identifier, "keyid:always");
  if (!options.extendedKeyUsage.empty()) {
    AddExtension(certificate, issuing, NID_ext_key_usage, options.extendedKeyUsage);
  }
  AddNames(certificate, options);
  EVP_PKEY* signingKey = issuer == nullptr ? made.key.get() : issuer->key.get();
  Require(X509_sign(certificate, signingKey, EVP_sha256()) > 0);
  return made;
}

Identity MakeCa(const std::string& commonName, const Identity* issuer) {
  IdentityOptions options;
  options.commonName = commonName;
  options.dnsNames = {};
  options.isCa = true;
  return MakeIdentity(options, issuer);
}

Identity MakeLookalike(const Identity& original) {
  Identity made{OpenSsl::OwnedCertificate(X509_dup(original.certificate.get())),
                OpenSsl::OwnedKey(MakeKey(0))};
  Require(X509_set_pubkey(made.certificate.get(), made.key.get()) == 1);
  Require(X509_sign(made.certificate.get(), made.key.get(), EVP_sha256()) > 0);
  return made;
}

Identity MakeRenewed(const Identity& original, const Identity& issuer) {
  Require(EVP_PKEY_up_ref(original.key.get()) == 1);
  Identity made{OpenSsl::OwnedCertificate(X509_dup(original.certificate.get())),
                OpenSsl::OwnedKey(original.key.get())};
  SetSerialNumber(made.certificate.get());
  Require(X509_sign(made.certificate.get(), issuer.key.get(), EVP_sha256()) > 0);
  return made;
}

std::string MakeCrl(const Identity& issuer, const Identity* revoked, long nextUpdate,
                    long thisUpdate, std::time_t now) {
  const OpenSsl::OwnedCrl crl(X509_CRL_new());
  Require(X509_CRL_set_version(crl.get(), X509_CRL_VERSION_2) == 1);
  Require(X509_CRL_set_issuer_name(crl.get(), X509_get_subject_name(issuer.certificate.get())) ==
          1);
  const OpenSsl::Owned<ASN1_TIME, ASN1_TIME_free> before(
      ASN1_TIME_adj(nullptr, now, 0, thisUpdate));
  const OpenSsl::Owned<ASN1_TIME, ASN1_TIME_free> next(ASN1_TIME_adj(nullptr, now, 0, nextUpdate));
  Require(X509_CRL_set1_lastUpdate(crl.get(), before.get()) == 1);
  Require(X509_CRL_set1_nextUpdate(crl.get(), next.get()) == 1);
  if (revoked != nullptr) {
    X509_REVOKED* entry = X509_REVOKED_new();
    Require(X509_REVOKED_set_serialNumber(entry,
                                          X509_get_serialNumber(revoked->certificate.get())) == 1);
    Require(X509_REVOKED_set_revocationDate(entry, before.get()) == 1);
    Require(X509_CRL_add0_revoked(crl.get(), entry) == 1);
  }
  AddKeyIdentifier(crl.get(), issuer.certificate.get());
  Require(X509_CRL_sign(crl.get(), issuer.key.get(), EVP_sha256()) > 0);
  const OpenSsl::OwnedBio bio(BIO_new(BIO_s_mem()));
  Require(PEM_write_bio_X509_CRL(bio.get(), crl.get()) == 1);
  return TakeText(bio.get());
}

}  // namespace Tarnik::Testing
