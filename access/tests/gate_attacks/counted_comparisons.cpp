#include "gate_attacks/counted_comparisons.h"

namespace SsoClient::Access::Testing {
namespace {

thread_local CountedComparisons* counting = nullptr;

}  // namespace

CountedComparisons::CountedComparisons() {
  counting = this;
}

CountedComparisons::~CountedComparisons() {
  counting = nullptr;
}

static void CountComparison(std::size_t length) {
  if (counting != nullptr) {
    counting->Add(length);
  }
}

}  // namespace SsoClient::Access::Testing

// Replaces OpenSSL's function of this name, which the platform library calls.
extern "C" __attribute__((visibility("default"))) int CRYPTO_memcmp(const void* a, const void* b,
                                                                    std::size_t length) {
  SsoClient::Access::Testing::CountComparison(length);
  const auto* const first = static_cast<const unsigned char*>(a);
  const auto* const second = static_cast<const unsigned char*>(b);
  unsigned difference = 0;
  for (std::size_t i = 0; i < length; ++i) {
    difference |= static_cast<unsigned>(first[i] ^ second[i]);
  }
  return static_cast<int>(difference);
}
