#ifndef TARNIK_SUPPORT_OPENSSL_H
#define TARNIK_SUPPORT_OPENSSL_H

#include <memory>

#include <openssl/bio.h>
#include <openssl/bn.h>
#include <openssl/ecdsa.h>
#include <openssl/evp.h>
#include <openssl/pkcs12.h>
#include <openssl/ssl.h>
#include <openssl/store.h>
#include <openssl/x509.h>
#include <openssl/x509v3.h>

#include "support/openssl_section.h"

namespace Tarnik::OpenSsl {

/// Frees an object with the OpenSSL function `Function`. Freeing takes locks of OpenSSL too.
template <auto Function>
struct Free {
  template <class T>
  void operator()(T* object) const noexcept {
    const Section section;
    Function(object);
  }
};

struct FreeMemory {
  void operator()(void* memory) const noexcept { OPENSSL_free(memory); }
};

struct FreeCertificates {
  void operator()(STACK_OF(X509) * certificates) const noexcept {
    const Section section;
    sk_X509_pop_free(certificates, X509_free);
  }
};

struct FreeGeneralNames {
  void operator()(GENERAL_NAMES* names) const noexcept { GENERAL_NAMES_free(names); }
};

template <class T, auto Function>
using Owned = std::unique_ptr<T, Free<Function>>;

using OwnedBigNumber = Owned<BIGNUM, BN_free>;
using OwnedBio = Owned<BIO, BIO_free_all>;
using OwnedCertificate = Owned<X509, X509_free>;
using OwnedCertificates = std::unique_ptr<STACK_OF(X509), FreeCertificates>;
using OwnedCrl = Owned<X509_CRL, X509_CRL_free>;
using OwnedDigest = Owned<EVP_MD, EVP_MD_free>;
using OwnedDigestContext = Owned<EVP_MD_CTX, EVP_MD_CTX_free>;
using OwnedEcdsaSignature = Owned<ECDSA_SIG, ECDSA_SIG_free>;
using OwnedGeneralNames = std::unique_ptr<GENERAL_NAMES, FreeGeneralNames>;
using OwnedKey = Owned<EVP_PKEY, EVP_PKEY_free>;
using OwnedKeyContext = Owned<EVP_PKEY_CTX, EVP_PKEY_CTX_free>;
/// OpenSSL cleanses the memory of the key.
using OwnedKeyInfo = Owned<PKCS8_PRIV_KEY_INFO, PKCS8_PRIV_KEY_INFO_free>;
using OwnedPkcs12 = Owned<PKCS12, PKCS12_free>;
using OwnedSsl = Owned<SSL, SSL_free>;
using OwnedSslContext = Owned<SSL_CTX, SSL_CTX_free>;
using OwnedSslSession = Owned<SSL_SESSION, SSL_SESSION_free>;
using OwnedStore = Owned<OSSL_STORE_CTX, OSSL_STORE_close>;
using OwnedStoreInfo = Owned<OSSL_STORE_INFO, OSSL_STORE_INFO_free>;
using OwnedTrustStore = Owned<X509_STORE, X509_STORE_free>;
/// Text or bytes that OpenSSL allocated.
template <class T>
using OwnedMemory = std::unique_ptr<T, FreeMemory>;

}  // namespace Tarnik::OpenSsl

#endif
