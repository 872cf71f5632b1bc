#include "xml/security/key_check.h"

#include <string>

#include <tarnik/xml/security/xml_security_exception.h>

#include "crypto/key_rules.h"
#include "support/quote.h"

namespace Tarnik::Xml::Security {
namespace {

using Crypto::PublicKeyImpl;
using Crypto::SignatureScheme;

void CheckStrength(const PublicKeyImpl& key, SignatureScheme scheme, const std::string& owner) {
  if (Crypto::IsStrong(key, scheme)) {
    return;
  }
  if (scheme == SignatureScheme::kEcdsa) {
    throw XmlSecurityException("The " + owner + " key is not on the curve P-256, P-384 or P-521.");
  }
  throw XmlSecurityException("The " + owner + " RSA key has " + std::to_string(key.Bits()) +
                             " bits; at least " + std::to_string(Crypto::kMinRsaBits) +
                             " are needed.");
}

}  // namespace

void CheckTrustedKey(const PublicKeyImpl& key, SignatureScheme scheme) {
  if (!Crypto::IsOfType(key, scheme)) {
    throw XmlSecurityException("The trusted key is not of the type of the signature algorithm.");
  }
  CheckStrength(key, scheme, "trusted");
}

void CheckSigningKey(const PublicKeyImpl& key, SignatureScheme scheme, std::string_view algorithm) {
  if (!Crypto::IsOfType(key, scheme)) {
    throw XmlSecurityException(std::string("The private key is ") +
                               Crypto::KeyTypeText(key.Algorithm()) + "; the signature algorithm " +
                               Quote(algorithm) + " needs " + Crypto::NeededKeyText(scheme) + ".");
  }
  CheckStrength(key, scheme, "private");
}

}  // namespace Tarnik::Xml::Security
