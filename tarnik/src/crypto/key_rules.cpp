#include "crypto/key_rules.h"

namespace Tarnik::Crypto {

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

bool IsStrong(const PublicKeyImpl& key, SignatureScheme scheme) noexcept {
  return scheme == SignatureScheme::kEcdsa ? key.NamedCurve() != Curve::kNone
                                           : key.Bits() >= kMinRsaBits;
}

bool IsUsableKey(const PublicKeyImpl& key, SignatureScheme scheme) noexcept {
  return IsOfType(key, scheme) && IsStrong(key, scheme);
}

const char* KeyTypeText(KeyAlgorithm algorithm) noexcept {
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

const char* NeededKeyText(SignatureScheme scheme) noexcept {
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

}  // namespace Tarnik::Crypto
