#ifndef TARNIK_TESTS_SUPPORT_TEST_REVOCATION_LISTS_H
#define TARNIK_TESTS_SUPPORT_TEST_REVOCATION_LISTS_H

#include <cstddef>
#include <functional>
#include <string>
#include <vector>

#include <openssl/rsa.h>

#include "support/openssl.h"
#include "support/test_certificates.h"

namespace Tarnik::Testing {

struct RevokedEntry {
  std::string serial;  ///< decimal
  const char* since = "20240601000000Z";
  const char* extension = nullptr;  ///< the object identifier of an extension, if it has one
  std::string content = {};         ///< that of the extension
  bool isCritical = false;
};

/// A revocation list of the issuer of `MakeCertificate`.
struct RevocationListRecipe {
  EVP_PKEY* key = SharedRsaKey();
  std::string issuerCommonName = "signer";
  /// The type of the strings in the name: MBSTRING_UTF8 or a V_ASN1 type of ASCII texts.
  int nameType = MBSTRING_UTF8;
  const char* thisUpdate = "20240701000000Z";
  const char* nextUpdate = "20990701000000Z";  ///< none if null
  std::vector<RevokedEntry> entries = {};
  /// Changes the list before it is signed.
  std::function<void(X509_CRL*)> edit = {};
  const EVP_MD* hash = EVP_sha256();
  bool isPss = false;
};

inline OpenSsl::Owned<ASN1_TIME, ASN1_TIME_free> MakeTime(const char* text) {
  OpenSsl::Owned<ASN1_TIME, ASN1_TIME_free> time(ASN1_TIME_new());
  Require(ASN1_TIME_set_string_X509(time.get(), text) == 1, "time");
  return time;
}

inline OpenSsl::Owned<X509_EXTENSION, X509_EXTENSION_free> MakeExtension(int number,
                                                                         const char* value) {
  OpenSsl::Owned<X509_EXTENSION, X509_EXTENSION_free> extension(
      X509V3_EXT_conf_nid(nullptr, nullptr, number, value));
  Require(extension != nullptr, "extension");
  return extension;
}

/// An extension with any content; by default one that nobody knows.
inline OpenSsl::Owned<X509_EXTENSION, X509_EXTENSION_free> MakeRawExtension(
    bool isCritical, const char* type = "1.2.3.4", const std::string& content = "x") {
  const OpenSsl::Owned<ASN1_OBJECT, ASN1_OBJECT_free> object(OBJ_txt2obj(type, 1));
  const OpenSsl::Owned<ASN1_OCTET_STRING, ASN1_OCTET_STRING_free> bytes(ASN1_OCTET_STRING_new());
  Require(ASN1_STRING_set(bytes.get(), content.data(), static_cast<int>(content.size())) == 1,
          "extension");
  OpenSsl::Owned<X509_EXTENSION, X509_EXTENSION_free> extension(
      X509_EXTENSION_create_by_OBJ(nullptr, object.get(), isCritical ? 1 : 0, bytes.get()));
  Require(extension != nullptr, "extension");
  return extension;
}

inline X509_REVOKED* MakeEntry(const RevokedEntry& entry) {
  X509_REVOKED* revoked = X509_REVOKED_new();
  BIGNUM* number = nullptr;
  Require(BN_dec2bn(&number, entry.serial.c_str()) > 0, "serial");
  const OpenSsl::OwnedBigNumber owner(number);
  const OpenSsl::Owned<ASN1_INTEGER, ASN1_INTEGER_free> serial(BN_to_ASN1_INTEGER(number, nullptr));
  Require(X509_REVOKED_set_serialNumber(revoked, serial.get()) == 1, "serial");
  Require(X509_REVOKED_set_revocationDate(revoked, MakeTime(entry.since).get()) == 1, "date");
  if (entry.extension != nullptr) {
    const auto extension = MakeRawExtension(entry.isCritical, entry.extension, entry.content);
    Require(X509_REVOKED_add_ext(revoked, extension.get(), -1) == 1, "extension");
  }
  return revoked;
}

inline void SignList(X509_CRL* list, const RevocationListRecipe& recipe) {
  const OpenSsl::OwnedDigestContext context(EVP_MD_CTX_new());
  EVP_PKEY_CTX* keyContext = nullptr;
  Require(EVP_DigestSignInit(context.get(), &keyContext, recipe.hash, nullptr, recipe.key) == 1,
          "signature");
  if (recipe.isPss) {
    Require(EVP_PKEY_CTX_set_rsa_padding(keyContext, RSA_PKCS1_PSS_PADDING) == 1 &&
                EVP_PKEY_CTX_set_rsa_pss_saltlen(keyContext, RSA_PSS_SALTLEN_DIGEST) == 1,
            "PSS");
  }
  Require(X509_CRL_sign_ctx(list, context.get()) > 0, "signature");
}

inline void AddIssuerPart(X509_NAME* name, const char* field, int type, const std::string& text) {
  std::string bytes;
  for (const char c : text) {
    bytes += type == V_ASN1_BMPSTRING ? std::string{'\0', c} : std::string{c};
  }
  Require(X509_NAME_add_entry_by_txt(name, field, type,
                                     reinterpret_cast<const unsigned char*>(bytes.data()),
                                     static_cast<int>(bytes.size()), -1, 0) == 1,
          "name");
}

inline std::vector<unsigned char> MakeRevocationListDer(const RevocationListRecipe& recipe = {}) {
  const OpenSsl::OwnedCrl list(X509_CRL_new());
  X509_CRL* raw = list.get();
  Require(X509_CRL_set_version(raw, X509_CRL_VERSION_2) == 1, "version");
  const OpenSsl::Owned<X509_NAME, X509_NAME_free> name(X509_NAME_new());
  AddIssuerPart(name.get(), "O", recipe.nameType, "Test, Inc.");
  AddIssuerPart(name.get(), "CN", recipe.nameType, recipe.issuerCommonName);
  Require(X509_CRL_set_issuer_name(raw, name.get()) == 1, "name");
  Require(X509_CRL_set1_lastUpdate(raw, MakeTime(recipe.thisUpdate).get()) == 1, "thisUpdate");
  if (recipe.nextUpdate != nullptr) {
    Require(X509_CRL_set1_nextUpdate(raw, MakeTime(recipe.nextUpdate).get()) == 1, "nextUpdate");
  }
  for (const RevokedEntry& entry : recipe.entries) {
    Require(X509_CRL_add0_revoked(raw, MakeEntry(entry)) == 1, "entry");
  }
  if (recipe.edit) {
    recipe.edit(raw);
  }
  SignList(raw, recipe);
  unsigned char* bytes = nullptr;
  const int length = i2d_X509_CRL(raw, &bytes);
  Require(length > 0, "encoding");
  const OpenSsl::OwnedMemory<unsigned char> owner(bytes);
  return {bytes, bytes + length};
}

}  // namespace Tarnik::Testing

#endif
