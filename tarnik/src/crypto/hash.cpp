#include "crypto/hash.h"

#include <string>

#include <tarnik/crypto/crypto_exception.h>

#include "support/openssl_error.h"

namespace Tarnik::Crypto {
namespace {

constexpr std::array<const char*, kHashCount> kHashNames{"SHA2-256", "SHA2-384", "SHA2-512"};

const EVP_MD* Fetch(Hash hash) {
  const OpenSsl::ErrorScope errors;
  const char* name = kHashNames[static_cast<std::size_t>(hash)];
  const EVP_MD* fetched = EVP_MD_fetch(nullptr, name, nullptr);
  if (fetched == nullptr) {
    throw CryptoException(errors.Describe(std::string("The hash ") + name + " is not available"));
  }
  return fetched;
}

}  // namespace

// The implementations are never freed, since threads may use them while the process ends.
const EVP_MD* FetchedHash(Hash hash) {
  switch (hash) {
    case Hash::kSha256: {
      static const EVP_MD* const fetched = Fetch(Hash::kSha256);
      return fetched;
    }
    case Hash::kSha384: {
      static const EVP_MD* const fetched = Fetch(Hash::kSha384);
      return fetched;
    }
    case Hash::kSha512:
      break;
  }
  static const EVP_MD* const fetched = Fetch(Hash::kSha512);
  return fetched;
}

}  // namespace Tarnik::Crypto
