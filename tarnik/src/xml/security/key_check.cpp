#include "xml/security/key_check.h"

#include <string>

#include <tarnik/xml/security/xml_security_exception.h>

#include "support/quote.h"

namespace Tarnik::Xml::Security {
namespace {

using Crypto::Curve;
using Crypto::KeyAlgorithm;
using Crypto::PublicKeyImpl;
using Crypto::SignatureScheme;

// NIST SP 800-131A: shorter RSA keys are disallowed.
constexpr int kMinRsaBits = 2048;

bool IsStrong(const PublicKeyImpl& key, SignatureScheme scheme) noexcept {
  return scheme == SignatureScheme::kEcdsa ? key.NamedCurve() != Curve::kNone
                                           : key.Bits() >= kMinRsaBits;
}

void CheckStrength(const PublicKeyImpl& key, SignatureScheme scheme, const std::string& owner) {
  if (IsStrong(key, scheme)) {
    return;
  }
  if (scheme == SignatureScheme::kEcdsa) {
    throw XmlSecurityException("The " + owner + " key is not on the curve P-256, P-384 or P-521.");
  }
  throw XmlSecurityException("The " + owner + " RSA key has " + std::to_string(key.Bits()) +
                             " bits; at least " + std::to_string(kMinRsaBits) + " are needed.");
}

const char* TypeName(KeyAlgorithm algorithm) noexcept {
  switch (algorithm) {
    case KeyAlgorithm::kRsa:
      return "an RSA key";
    case KeyAlgorithm::kRsaPss:
      return "an RSA-PSS key";
    case KeyAlgorithm::kEc:
      return "an EC key";
    case KeyAlgorithm::kOther:
      break;
  }
  return "neither an RSA nor an EC key";
}

const char* NeededType(SignatureScheme scheme) noexcept {
  switch (scheme) {
    case SignatureScheme::kRsaPkcs1:
      return "an RSA key";
    case SignatureScheme::kRsaPss:
      return "an RSA or RSA-PSS key";
    case SignatureScheme::kEcdsa:
      break;
  }
  return "an EC key";
}

}  // namespace

bool IsOfType(const PublicKeyImpl& key, SignatureScheme scheme) noexcept {
  switch (scheme) {
    case SignatureScheme::kRsaPkcs1:
      return key.Algorithm() == KeyAlgorithm::kRsa;
    case SignatureScheme::kRsaPss:
      return key.Algorithm() == KeyAlgorithm::kRsa || key.Algorithm() == KeyAlgorithm::kRsaPss;
    case SignatureScheme::kEcdsa:
      break;
  }
  return key.Algorithm() == KeyAlgorithm::kEc;
}

bool IsUsableKey(const PublicKeyImpl& key, SignatureScheme scheme) noexcept {
  return IsOfType(key, scheme) && IsStrong(key, scheme);
}

void CheckTrustedKey(const PublicKeyImpl& key, SignatureScheme scheme) {
  if (!IsOfType(key, scheme)) {
    throw XmlSecurityException("The trusted key is not of the type of the signature algorithm.");
  }
  CheckStrength(key, scheme, "trusted");
}

void CheckSigningKey(const PublicKeyImpl& key, SignatureScheme scheme, std::string_view algorithm) {
  if (!IsOfType(key, scheme)) {
    throw XmlSecurityException(std::string("The private key is ") + TypeName(key.Algorithm()) +
                               "; the signature algorithm " + Quote(algorithm) + " needs " +
                               NeededType(scheme) + ".");
  }
  CheckStrength(key, scheme, "private");
}

}  // namespace Tarnik::Xml::Security
