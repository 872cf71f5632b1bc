#include <array>
#include <atomic>
#include <cstddef>
#include <utility>

#include <openssl/crypto.h>

#include <tarnik/crypto/crypto_exception.h>
#include <tarnik/crypto/digest.h>

#include "crypto/hash.h"
#include "support/openssl.h"
#include "support/openssl_error.h"

namespace Tarnik::Crypto {
namespace {

constexpr std::size_t kDigestSlots = 16;

// An idle context of SHA-256. Making one costs as much as digesting a few hundred bytes. A context
// is in at most one place, so threads need no lock; each prefers its own slot. The contexts are
// never freed, since threads may use them while the process ends.
struct alignas(64) DigestSlot {
  std::atomic<EVP_MD_CTX*> idle{nullptr};
};

constinit std::array<DigestSlot, kDigestSlots> digestSlots{};
constinit std::atomic<std::size_t> digestThreads{0};
constinit thread_local DigestSlot* digestSlotOfThread = nullptr;

DigestSlot& OwnDigestSlot() noexcept {
  if (digestSlotOfThread == nullptr) {
    digestSlotOfThread =
        &digestSlots[digestThreads.fetch_add(1, std::memory_order_relaxed) % kDigestSlots];
  }
  return *digestSlotOfThread;
}

OpenSsl::OwnedDigestContext TakeDigestContext(DigestSlot& slot) {
  return OpenSsl::OwnedDigestContext(slot.idle.exchange(nullptr, std::memory_order_acquire));
}

// If another thread has put its context there meanwhile, this one is freed.
void KeepDigestContext(DigestSlot& slot, OpenSsl::OwnedDigestContext context) noexcept {
  EVP_MD_CTX* none = nullptr;
  if (slot.idle.compare_exchange_strong(none, context.get(), std::memory_order_release,
                                        std::memory_order_relaxed)) {
    static_cast<void>(context.release());
  }
}

// A context that has been used keeps its algorithm.
bool BeginSha256(OpenSsl::OwnedDigestContext& context) {
  if (context != nullptr) {
    return EVP_DigestInit_ex2(context.get(), nullptr, nullptr) == 1;
  }
  context.reset(EVP_MD_CTX_new());
  return context != nullptr &&
         EVP_DigestInit_ex2(context.get(), FetchedHash(Hash::kSha256), nullptr) == 1;
}

}  // namespace

Sha256Digest Sha256(std::string_view bytes) {
  const OpenSsl::ErrorScope errors;
  DigestSlot& slot = OwnDigestSlot();
  OpenSsl::OwnedDigestContext context = TakeDigestContext(slot);
  Sha256Digest digest;
  if (!BeginSha256(context) || EVP_DigestUpdate(context.get(), bytes.data(), bytes.size()) != 1 ||
      EVP_DigestFinal_ex(context.get(), digest.data(), nullptr) != 1) {
    throw CryptoException(errors.Describe("The digest cannot be computed"));
  }
  KeepDigestContext(slot, std::move(context));
  return digest;
}

bool IsEqualInConstantTime(const void* a, const void* b, std::size_t length) noexcept {
  return CRYPTO_memcmp(a, b, length) == 0;
}

}  // namespace Tarnik::Crypto
