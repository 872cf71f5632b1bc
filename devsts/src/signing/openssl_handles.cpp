#include "signing/openssl_handles.h"

#include <array>
#include <stdexcept>

#include <openssl/err.h>
#include <openssl/pem.h>

namespace DevSts {
namespace {

BioHandle ReadFrom(std::string_view text) {
  BioHandle bio(BIO_new_mem_buf(text.data(), static_cast<int>(text.size())));
  if (!bio) {
    ThrowOpenSslError("memory buffer");
  }
  return bio;
}

std::string ContentOf(BIO* bio) {
  char* data = nullptr;
  const long size = BIO_get_mem_data(bio, &data);
  return std::string(data, static_cast<std::size_t>(size));
}

}  // namespace

void ThrowOpenSslError(const std::string& what) {
  std::array<char, 256> text{"no further information"};
  const unsigned long code = ERR_peek_last_error();
  if (code != 0) {
    ERR_error_string_n(code, text.data(), text.size());
  }
  ERR_clear_error();
  throw std::runtime_error(what + ": " + text.data());
}

CertificateHandle LoadCertificate(std::string_view pem) {
  CertificateHandle certificate(PEM_read_bio_X509(ReadFrom(pem).get(), nullptr, nullptr, nullptr));
  if (!certificate) {
    ThrowOpenSslError("certificate does not load");
  }
  return certificate;
}

KeyHandle LoadPrivateKey(std::string_view pem) {
  KeyHandle key(PEM_read_bio_PrivateKey(ReadFrom(pem).get(), nullptr, nullptr, nullptr));
  if (!key) {
    ThrowOpenSslError("private key does not load");
  }
  return key;
}

std::string CertificateToPem(X509* certificate) {
  BioHandle bio(BIO_new(BIO_s_mem()));
  if (!bio || PEM_write_bio_X509(bio.get(), certificate) != 1) {
    ThrowOpenSslError("certificate cannot be written");
  }
  return ContentOf(bio.get());
}

std::string PrivateKeyToPem(EVP_PKEY* key) {
  BioHandle bio(BIO_new(BIO_s_mem()));
  if (!bio ||
      PEM_write_bio_PKCS8PrivateKey(bio.get(), key, nullptr, nullptr, 0, nullptr, nullptr) != 1) {
    ThrowOpenSslError("private key cannot be written");
  }
  return ContentOf(bio.get());
}

}  // namespace DevSts
