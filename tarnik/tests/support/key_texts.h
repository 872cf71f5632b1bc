#ifndef TARNIK_TESTS_SUPPORT_KEY_TEXTS_H
#define TARNIK_TESTS_SUPPORT_KEY_TEXTS_H

#include <cstddef>
#include <string>

#include <openssl/pem.h>

#include "support/openssl.h"
#include "support/test_certificates.h"

namespace Tarnik::Testing {

inline std::string TextOf(BIO* memory) {
  char* text = nullptr;
  const long length = BIO_get_mem_data(memory, &text);
  return {text, static_cast<std::size_t>(length)};
}

/// PKCS#8; encrypted if a passphrase is given.
inline std::string ToPkcs8Pem(EVP_PKEY* key, const std::string* passphrase = nullptr) {
  const OpenSsl::OwnedBio memory(BIO_new(BIO_s_mem()));
  const EVP_CIPHER* cipher = passphrase == nullptr ? nullptr : EVP_aes_256_cbc();
  const char* text = passphrase == nullptr ? nullptr : passphrase->data();
  const int length = passphrase == nullptr ? 0 : static_cast<int>(passphrase->size());
  Require(
      PEM_write_bio_PKCS8PrivateKey(memory.get(), key, cipher, text, length, nullptr, nullptr) == 1,
      "PKCS#8");
  return TextOf(memory.get());
}

/// The traditional form for the type of the key; encrypted if a passphrase is given.
inline std::string ToTraditionalPem(EVP_PKEY* key, const std::string* passphrase = nullptr) {
  const OpenSsl::OwnedBio memory(BIO_new(BIO_s_mem()));
  const EVP_CIPHER* cipher = passphrase == nullptr ? nullptr : EVP_aes_128_cbc();
  const unsigned char* text =
      passphrase == nullptr ? nullptr : reinterpret_cast<const unsigned char*>(passphrase->data());
  const int length = passphrase == nullptr ? 0 : static_cast<int>(passphrase->size());
  Require(PEM_write_bio_PrivateKey_traditional(memory.get(), key, cipher, text, length, nullptr,
                                               nullptr) == 1,
          "traditional form");
  return TextOf(memory.get());
}

}  // namespace Tarnik::Testing

#endif
