#include <openssl/rsa.h>

#include <tarnik/crypto/crypto_exception.h>
#include <array>
#include <string_view>
#include <utility>

#include "crypto/public_key_impl.h"
#include "support/openssl_error.h"

namespace Tarnik::Crypto {
namespace {

// More threads than this may verify with one key at once; they then set up contexts of their own.
constexpr std::size_t kMaxIdleContexts = 64;

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

bool SetUp(EVP_PKEY_CTX* context, SignatureScheme scheme, Hash hash) {
  if (EVP_PKEY_verify_init(context) != 1) {
    return false;
  }
  const EVP_MD* algorithm = FetchedHash(hash);
  switch (scheme) {
    case SignatureScheme::kRsaPkcs1:
      return EVP_PKEY_CTX_set_rsa_padding(context, RSA_PKCS1_PADDING) == 1 &&
             EVP_PKEY_CTX_set_signature_md(context, algorithm) == 1;
    case SignatureScheme::kRsaPss:
      return EVP_PKEY_CTX_set_rsa_padding(context, RSA_PKCS1_PSS_PADDING) == 1 &&
             EVP_PKEY_CTX_set_signature_md(context, algorithm) == 1 &&
             EVP_PKEY_CTX_set_rsa_mgf1_md(context, algorithm) == 1 &&
             EVP_PKEY_CTX_set_rsa_pss_saltlen(context, RSA_PSS_SALTLEN_DIGEST) == 1;
    case SignatureScheme::kEcdsa:
      break;
  }
  return EVP_PKEY_CTX_set_signature_md(context, algorithm) == 1;
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
  OpenSsl::OwnedKeyContext context = TakeContext(scheme, hash);
  // Zero and every negative result mean that the signature was not found to be good.
  if (EVP_PKEY_verify(context.get(), signature, signatureLength, digest, HashLength(hash)) != 1) {
    return false;
  }
  KeepContext(scheme, hash, std::move(context));
  return true;
}

OpenSsl::OwnedKeyContext PublicKeyImpl::TakeContext(SignatureScheme scheme, Hash hash) const {
  IdleContexts& idle = IdleFor(scheme, hash);
  {
    const std::lock_guard lock(idle.mutex);
    if (!idle.contexts.empty()) {
      OpenSsl::OwnedKeyContext context = std::move(idle.contexts.back());
      idle.contexts.pop_back();
      return context;
    }
  }
  const OpenSsl::ErrorScope errors;
  OpenSsl::OwnedKeyContext context(EVP_PKEY_CTX_new_from_pkey(nullptr, key_.get(), nullptr));
  if (context == nullptr || !SetUp(context.get(), scheme, hash)) {
    throw CryptoException(errors.Describe("The key cannot verify signatures of this kind"));
  }
  return context;
}

void PublicKeyImpl::KeepContext(SignatureScheme scheme, Hash hash,
                                OpenSsl::OwnedKeyContext context) const {
  IdleContexts& idle = IdleFor(scheme, hash);
  const std::lock_guard lock(idle.mutex);
  if (idle.contexts.size() < kMaxIdleContexts) {
    idle.contexts.push_back(std::move(context));
  }
}

PublicKeyImpl::IdleContexts& PublicKeyImpl::IdleFor(SignatureScheme scheme,
                                                    Hash hash) const noexcept {
  return idle_[static_cast<std::size_t>(scheme) * kHashCount + static_cast<std::size_t>(hash)];
}

}  // namespace Tarnik::Crypto
