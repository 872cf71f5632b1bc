#include "crypto/key_context_pool.h"

#include <mutex>
#include <string>
#include <utility>

#include <openssl/provider.h>
#include <openssl/rsa.h>

#include <tarnik/crypto/crypto_exception.h>

#include "support/object_lock.h"
#include "support/openssl_error.h"

namespace Tarnik::Crypto {
namespace {

// If more threads than this use one key at once, the others set up a new context each time.
constexpr std::size_t kMaxIdleContexts = 64;

// A key may be in a device whose provider also exports the public half. Any other provider would
// import that half and then be unable to sign.
std::string ProviderOf(const EVP_PKEY* key) {
  const OSSL_PROVIDER* provider = EVP_PKEY_get0_provider(key);
  return provider == nullptr ? ""
                             : std::string("?provider='") + OSSL_PROVIDER_get0_name(provider) + "'";
}

OpenSsl::OwnedKeyContext NewContext(EVP_PKEY* key, KeyOperation operation) {
  const std::string properties = operation == KeyOperation::kSign ? ProviderOf(key) : "";
  return OpenSsl::OwnedKeyContext(
      EVP_PKEY_CTX_new_from_pkey(nullptr, key, properties.empty() ? nullptr : properties.c_str()));
}

bool Begin(EVP_PKEY_CTX* context, KeyOperation operation) {
  return operation == KeyOperation::kSign ? EVP_PKEY_sign_init(context) == 1
                                          : EVP_PKEY_verify_init(context) == 1;
}

bool SetUp(EVP_PKEY_CTX* context, SignatureScheme scheme, Hash hash) {
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

const char* FailureOf(KeyOperation operation) noexcept {
  return operation == KeyOperation::kSign ? "The key cannot make signatures of this kind"
                                          : "The key cannot verify signatures of this kind";
}

}  // namespace

OpenSsl::OwnedKeyContext KeyContextPool::Take(EVP_PKEY* key, SignatureScheme scheme, Hash hash) {
  if (OpenSsl::OwnedKeyContext idle = TakeIdle(scheme, hash)) {
    return idle;
  }
  const OpenSsl::ErrorScope errors;
  OpenSsl::OwnedKeyContext context = NewContext(key, operation_);
  if (context == nullptr || !Begin(context.get(), operation_) ||
      !SetUp(context.get(), scheme, hash)) {
    throw CryptoException(errors.Describe(FailureOf(operation_)));
  }
  return context;
}

void KeyContextPool::Keep(SignatureScheme scheme, Hash hash, OpenSsl::OwnedKeyContext context) {
  IdleContexts& idle = IdleFor(scheme, hash);
  const std::lock_guard lock(ObjectLock(&idle));
  if (idle.size() < kMaxIdleContexts) {
    idle.push_back(std::move(context));
  }
}

OpenSsl::OwnedKeyContext KeyContextPool::TakeIdle(SignatureScheme scheme, Hash hash) {
  IdleContexts& idle = IdleFor(scheme, hash);
  const std::lock_guard lock(ObjectLock(&idle));
  if (idle.empty()) {
    return nullptr;
  }
  OpenSsl::OwnedKeyContext context = std::move(idle.back());
  idle.pop_back();
  return context;
}

KeyContextPool::IdleContexts& KeyContextPool::IdleFor(SignatureScheme scheme, Hash hash) noexcept {
  return idle_[static_cast<std::size_t>(scheme) * kHashCount + static_cast<std::size_t>(hash)];
}

}  // namespace Tarnik::Crypto
