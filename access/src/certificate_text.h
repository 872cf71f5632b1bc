#ifndef SSOCLIENT_ACCESS_CERTIFICATE_TEXT_H
#define SSOCLIENT_ACCESS_CERTIFICATE_TEXT_H

#include <string>

#include <tarnik/crypto/certificate.h>

namespace SsoClient::Access {

/// The first eight bytes of the SHA-256 fingerprint, "AB:CD:EF:01:23:45:67:89...". It identifies
/// one of the certificates that the reader knows.
std::string ShortFingerprint(const Tarnik::Crypto::Certificate& certificate);

}  // namespace SsoClient::Access

#endif
