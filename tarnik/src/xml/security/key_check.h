#ifndef TARNIK_XML_SECURITY_KEY_CHECK_H
#define TARNIK_XML_SECURITY_KEY_CHECK_H

#include <string_view>

#include "crypto/public_key_impl.h"
#include "crypto/signature_scheme.h"

namespace Tarnik::Xml::Security {

/// Throws `XmlSecurityException` unless the key is of the scheme's type and, for RSA, has at least
/// 2048 bits or, for EC, is on P-256, P-384 or P-521.
void CheckTrustedKey(const Crypto::PublicKeyImpl& key, Crypto::SignatureScheme scheme);
/// The same for the public half of a key that is to sign with `algorithm`, whose scheme is
/// `scheme`.
void CheckSigningKey(const Crypto::PublicKeyImpl& key, Crypto::SignatureScheme scheme,
                     std::string_view algorithm);

}  // namespace Tarnik::Xml::Security

#endif
