#ifndef TARNIK_TESTS_SUPPORT_TEST_CERTIFICATES_H
#define TARNIK_TESTS_SUPPORT_TEST_CERTIFICATES_H

#include <cstddef>
#include <stdexcept>
#include <string>
#include <vector>

#include <tarnik/crypto/certificate.h>

#include "support/openssl.h"

namespace Tarnik::Testing {

inline void Require(bool condition, const char* what) {
  if (!condition) {
    throw std::runtime_error(std::string("test set-up failed: ") + what);
  }
}

inline OpenSsl::OwnedKey MakeRsaKey(unsigned bits) {
  OpenSsl::OwnedKey key(EVP_PKEY_Q_keygen(nullptr, nullptr, "RSA", std::size_t{bits}));
  Require(key != nullptr, "RSA key");
  return key;
}

inline OpenSsl::OwnedKey MakeEcKey(const char* curve) {
  OpenSsl::OwnedKey key(EVP_PKEY_Q_keygen(nullptr, nullptr, "EC", curve));
  Require(key != nullptr, "EC key");
  return key;
}

/// A key of a type without parameters, such as "ED25519".
inline OpenSsl::OwnedKey MakeKey(const char* type) {
  OpenSsl::OwnedKey key(EVP_PKEY_Q_keygen(nullptr, nullptr, type));
  Require(key != nullptr, "key");
  return key;
}

/// A key that is created once per process, since generating RSA keys is slow.
inline EVP_PKEY* SharedRsaKey() {
  static const OpenSsl::OwnedKey key = MakeRsaKey(2048);
  return key.get();
}

struct CertificateRecipe {
  EVP_PKEY* key = SharedRsaKey();
  std::string commonName = "signer";
  std::string issuerCommonName = "signer";
  std::string organization = "Test, Inc.";
  const char* serial = "4711";
  const char* notBefore = "20240305070809Z";
  const char* notAfter = "20990305070809Z";
  bool withKeyIdentifier = false;
  std::string comment{};  // an extension, if it is not empty
};

inline void AddName(X509_NAME* name, const char* field, const std::string& text) {
  const auto* bytes = reinterpret_cast<const unsigned char*>(text.data());
  Require(X509_NAME_add_entry_by_txt(name, field, MBSTRING_UTF8, bytes,
                                     static_cast<int>(text.size()), -1, 0) == 1,
          "name");
}

inline std::vector<unsigned char> MakeCertificateDer(const CertificateRecipe& recipe = {}) {
  const OpenSsl::OwnedCertificate certificate(X509_new());
  X509* raw = certificate.get();
  BIGNUM* number = nullptr;
  Require(BN_dec2bn(&number, recipe.serial) > 0, "serial");
  const OpenSsl::OwnedBigNumber serial(number);
  Require(X509_set_version(raw, X509_VERSION_3) == 1, "version");
  Require(BN_to_ASN1_INTEGER(number, X509_get_serialNumber(raw)) != nullptr, "serial");
  Require(ASN1_TIME_set_string_X509(X509_getm_notBefore(raw), recipe.notBefore) == 1, "start");
  Require(ASN1_TIME_set_string_X509(X509_getm_notAfter(raw), recipe.notAfter) == 1, "end");
  AddName(X509_get_subject_name(raw), "O", recipe.organization);
  AddName(X509_get_subject_name(raw), "CN", recipe.commonName);
  AddName(X509_get_issuer_name(raw), "O", recipe.organization);
  AddName(X509_get_issuer_name(raw), "CN", recipe.issuerCommonName);
  Require(X509_set_pubkey(raw, recipe.key) == 1, "public key");
  if (recipe.withKeyIdentifier) {
    X509V3_CTX context;
    X509V3_set_ctx(&context, raw, raw, nullptr, nullptr, 0);
    const OpenSsl::Owned<X509_EXTENSION, X509_EXTENSION_free> extension(
        X509V3_EXT_conf_nid(nullptr, &context, NID_subject_key_identifier, "hash"));
    Require(X509_add_ext(raw, extension.get(), -1) == 1, "key identifier");
  }
  if (!recipe.comment.empty()) {
    const OpenSsl::Owned<X509_EXTENSION, X509_EXTENSION_free> extension(
        X509V3_EXT_conf_nid(nullptr, nullptr, NID_netscape_comment, recipe.comment.c_str()));
    Require(X509_add_ext(raw, extension.get(), -1) == 1, "comment");
  }
  const bool hashless = EVP_PKEY_get_base_id(recipe.key) == EVP_PKEY_ED25519;
  Require(X509_sign(raw, recipe.key, hashless ? nullptr : EVP_sha256()) > 0, "signature");
  unsigned char* bytes = nullptr;
  const int length = i2d_X509(raw, &bytes);
  Require(length > 0, "encoding");
  const OpenSsl::OwnedMemory<unsigned char> owner(bytes);
  return {bytes, bytes + length};
}

inline Ref<const Crypto::Certificate> MakeCertificate(const CertificateRecipe& recipe = {}) {
  const std::vector<unsigned char> der = MakeCertificateDer(recipe);
  return Crypto::CreateCertificateFromDer(der.data(), der.size());
}

}  // namespace Tarnik::Testing

#endif
