#ifndef TARNIK_CRYPTO_DECODED_CERTIFICATE_H
#define TARNIK_CRYPTO_DECODED_CERTIFICATE_H

#include <tarnik/core/ref.h>
#include <tarnik/crypto/certificate.h>

#include "crypto/certificate_impl.h"

namespace Tarnik::Crypto {

/// The certificate as this library implements it, decoded from its bytes if a caller implements it.
/// Throws `CryptoException` when they cannot be decoded.
inline Ref<const CertificateImpl> DecodedCertificate(const Certificate& certificate) {
  if (const auto* implementation = dynamic_cast<const CertificateImpl*>(&certificate)) {
    return Ref<const CertificateImpl>(implementation);
  }
  const auto decoded = CreateCertificateFromDer(certificate.DerBytes(), certificate.DerLength());
  return Ref<const CertificateImpl>(&dynamic_cast<const CertificateImpl&>(*decoded));
}

}  // namespace Tarnik::Crypto

#endif
