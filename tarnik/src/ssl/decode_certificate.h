#ifndef TARNIK_SSL_DECODE_CERTIFICATE_H
#define TARNIK_SSL_DECODE_CERTIFICATE_H

#include <tarnik/crypto/certificate.h>

#include "support/openssl.h"

namespace Tarnik::Ssl {

/// `certificate` as OpenSSL's type, or null when OpenSSL cannot decode it. Decoded from its bytes,
/// since callers may implement `Certificate` themselves.
inline OpenSsl::OwnedCertificate DecodeCertificate(const Crypto::Certificate& certificate) {
  const unsigned char* bytes = certificate.DerBytes();
  return OpenSsl::OwnedCertificate(
      d2i_X509(nullptr, &bytes, static_cast<long>(certificate.DerLength())));
}

}  // namespace Tarnik::Ssl

#endif
