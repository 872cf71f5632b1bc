#include "crypto/public_key_info.h"

#include <cstddef>

#include <openssl/core_names.h>

#include "crypto/der_writer.h"
#include "crypto/object_identifier.h"
#include "support/openssl.h"
#include "support/openssl_error.h"

namespace Tarnik::Crypto {
namespace {

constexpr std::string_view kRsaEncryption = "1.2.840.113549.1.1.1";
constexpr std::string_view kEcPublicKey = "1.2.840.10045.2.1";
constexpr std::string_view kDerNull("\x05\x00", 2);
constexpr char kUncompressed = 4;

std::string IdentifierOf(std::string_view dotted) {
  return DerOf(DerTag::kObjectIdentifier, ObjectIdentifierOf(dotted));
}

std::vector<unsigned char> KeyInfo(const std::string& algorithm, std::string_view key) {
  const std::string der =
      DerOf(DerTag::kSequence, DerOf(DerTag::kSequence, algorithm) + DerOfBits(key));
  return {der.begin(), der.end()};
}

bool IsZero(std::string_view number) noexcept {
  return number.find_first_not_of('\0') == std::string_view::npos;
}

// A number of the key in `length` bytes, or as many as it needs if `length` is 0.
std::string NumberOf(const PublicKeyImpl& key, const char* name, std::size_t length) {
  BIGNUM* raw = nullptr;
  if (EVP_PKEY_get_bn_param(key.Handle(), name, &raw) != 1) {
    return {};
  }
  const OpenSsl::OwnedBigNumber number(raw);
  std::string bytes(length == 0 ? static_cast<std::size_t>(BN_num_bytes(raw)) : length, '\0');
  const int written = BN_bn2binpad(raw, reinterpret_cast<unsigned char*>(bytes.data()),
                                   static_cast<int>(bytes.size()));
  return written < 0 ? std::string() : bytes;
}

std::string_view IdentifierOf(Curve curve) noexcept {
  switch (curve) {
    case Curve::kP256:
      return "1.2.840.10045.3.1.7";
    case Curve::kP384:
      return "1.3.132.0.34";
    case Curve::kP521:
      return "1.3.132.0.35";
    case Curve::kNone:
      break;
  }
  return {};
}

std::vector<unsigned char> UsualEcKeyInfo(const PublicKeyImpl& key) {
  const std::size_t length = key.OrderLength();  // of these curves: that of the field too
  const std::string x = NumberOf(key, OSSL_PKEY_PARAM_EC_PUB_X, length);
  const std::string y = NumberOf(key, OSSL_PKEY_PARAM_EC_PUB_Y, length);
  if (x.empty() || y.empty()) {
    return {};
  }
  return EcPublicKeyInfo(IdentifierOf(key.NamedCurve()), kUncompressed + x + y);
}

}  // namespace

std::vector<unsigned char> RsaPublicKeyInfo(std::string_view modulus, std::string_view exponent) {
  if (IsZero(modulus) || IsZero(exponent)) {
    return {};
  }
  return KeyInfo(IdentifierOf(kRsaEncryption).append(kDerNull),
                 DerOf(DerTag::kSequence, DerOfNumber(modulus) + DerOfNumber(exponent)));
}

std::vector<unsigned char> EcPublicKeyInfo(std::string_view curve, std::string_view point) {
  const std::string identifier = ObjectIdentifierOf(curve);
  if (identifier.empty() || point.empty() || point.front() != kUncompressed) {
    return {};
  }
  return KeyInfo(IdentifierOf(kEcPublicKey) + DerOf(DerTag::kObjectIdentifier, identifier), point);
}

bool IsUsualPublicKeyInfo(const PublicKeyImpl& key, std::size_t length) noexcept {
  if (key.Algorithm() != KeyAlgorithm::kEc) {
    return key.Algorithm() == KeyAlgorithm::kRsa;
  }
  // A point is a byte and two numbers; the rest is that long for P-256, and shorter for others.
  constexpr std::size_t kMaxRest = 27;
  const std::size_t numbers = 2 * key.OrderLength();
  return key.NamedCurve() != Curve::kNone && length > numbers && length <= numbers + kMaxRest;
}

std::vector<unsigned char> UsualPublicKeyInfo(const PublicKeyImpl& key) {
  const OpenSsl::ErrorScope errors;
  switch (key.Algorithm()) {
    case KeyAlgorithm::kRsa:
    case KeyAlgorithm::kRsaPss:
      return RsaPublicKeyInfo(NumberOf(key, OSSL_PKEY_PARAM_RSA_N, 0),
                              NumberOf(key, OSSL_PKEY_PARAM_RSA_E, 0));
    case KeyAlgorithm::kEc:
      return key.NamedCurve() == Curve::kNone ? std::vector<unsigned char>() : UsualEcKeyInfo(key);
    case KeyAlgorithm::kOther:
      break;
  }
  return {};
}

}  // namespace Tarnik::Crypto
