#ifndef DEVSTS_SIGNING_OPENSSL_HANDLES_H
#define DEVSTS_SIGNING_OPENSSL_HANDLES_H

#include <memory>
#include <string>
#include <string_view>

#include <openssl/bio.h>
#include <openssl/evp.h>
#include <openssl/ssl.h>
#include <openssl/x509v3.h>

namespace DevSts {

template <auto free>
struct FreeWith {
  template <typename T>
  void operator()(T* object) const {
    free(object);
  }
};

using BioHandle = std::unique_ptr<BIO, FreeWith<BIO_free_all>>;
using KeyHandle = std::unique_ptr<EVP_PKEY, FreeWith<EVP_PKEY_free>>;
using KeyContextHandle = std::unique_ptr<EVP_PKEY_CTX, FreeWith<EVP_PKEY_CTX_free>>;
using RevocationListHandle = std::unique_ptr<X509_CRL, FreeWith<X509_CRL_free>>;
using DigestContextHandle = std::unique_ptr<EVP_MD_CTX, FreeWith<EVP_MD_CTX_free>>;
using CertificateHandle = std::unique_ptr<X509, FreeWith<X509_free>>;
using SslContextHandle = std::unique_ptr<SSL_CTX, FreeWith<SSL_CTX_free>>;
using SslHandle = std::unique_ptr<SSL, FreeWith<SSL_free>>;

// Throws std::runtime_error with OpenSSL's latest error, and clears its error queue.
[[noreturn]] void ThrowOpenSslError(const std::string& what);

// Each throws std::runtime_error if the text cannot be loaded.
CertificateHandle LoadCertificate(std::string_view pem);
KeyHandle LoadPrivateKey(std::string_view pem);

std::string CertificateToPem(X509* certificate);
std::string PrivateKeyToPem(EVP_PKEY* key);

}  // namespace DevSts

#endif
