#include <array>
#include <string_view>
#include <utility>

#include "crypto/public_key_impl.h"
#include "support/openssl_error.h"

namespace Tarnik::Crypto {
namespace {

KeyAlgorithm AlgorithmOf(const EVP_PKEY* key) noexcept {
  switch (EVP_PKEY_get_base_id(key)) {
    case EVP_PKEY_RSA:
      return KeyAlgorithm::kRsa;
    case EVP_PKEY_RSA_PSS:
      return KeyAlgorithm::kRsaPss;
    case EVP_PKEY_EC:
      return KeyAlgorithm::kEc;
    default:
      return KeyAlgorithm::kOther;
  }
}

Curve CurveOf(const EVP_PKEY* key) noexcept {
  std::array<char, 32> buffer{};
  std::size_t length = 0;
  if (EVP_PKEY_get_group_name(key, buffer.data(), buffer.size(), &length) != 1) {
    return Curve::kNone;
  }
  const std::string_view name(buffer.data(), length);
  if (name == SN_X9_62_prime256v1) {
    return Curve::kP256;
  }
  if (name == SN_secp384r1) {
    return Curve::kP384;
  }
  return name == SN_secp521r1 ? Curve::kP521 : Curve::kNone;
}

}  // namespace

PublicKeyImpl::PublicKeyImpl(OpenSsl::OwnedKey key)
    : key_(std::move(key)),
      algorithm_(AlgorithmOf(key_.get())),
      bits_(EVP_PKEY_get_bits(key_.get())),
      valueLength_(static_cast<std::size_t>(EVP_PKEY_get_size(key_.get()))) {
  if (algorithm_ == KeyAlgorithm::kEc) {
    const OpenSsl::ErrorScope errors;
    curve_ = CurveOf(key_.get());
  }
}

PublicKeyImpl::~PublicKeyImpl() = default;

bool PublicKeyImpl::Verify(SignatureScheme scheme, Hash hash, const unsigned char* digest,
                           const unsigned char* signature, std::size_t signatureLength) const {
  const OpenSsl::ErrorScope errors;
  OpenSsl::OwnedKeyContext context = contexts_.Take(key_.get(), scheme, hash);
  // Zero means a wrong signature. An error, which is negative, is treated in the same way.
  if (EVP_PKEY_verify(context.get(), signature, signatureLength, digest, HashLength(hash)) != 1) {
    return false;
  }
  contexts_.Keep(scheme, hash, std::move(context));
  return true;
}

}  // namespace Tarnik::Crypto
