#include "crypto/hash.h"

#include <array>
#include <atomic>
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

// The implementations are never freed, since threads may use them while the process ends. They are
// not the initialisers of static variables: a child that is forked while one is initialised would
// wait for it for ever.
const EVP_MD* FetchedHash(Hash hash) {
  static constinit std::array<std::atomic<const EVP_MD*>, kHashCount> fetched{};
  std::atomic<const EVP_MD*>& kept = fetched[static_cast<std::size_t>(hash)];
  if (const EVP_MD* const found = kept.load(std::memory_order_acquire)) {
    return found;
  }
  // Threads that get here together get the same object, with one reference each.
  const EVP_MD* const added = Fetch(hash);
  kept.store(added, std::memory_order_release);
  return added;
}

std::vector<unsigned char> HashOf(Hash hash, const unsigned char* bytes, std::size_t length) {
  const OpenSsl::ErrorScope errors;
  std::vector<unsigned char> value(HashLength(hash));
  if (EVP_Digest(bytes, length, value.data(), nullptr, FetchedHash(hash), nullptr) != 1) {
    throw CryptoException(errors.Describe("The digest cannot be computed"));
  }
  return value;
}

}  // namespace Tarnik::Crypto
