// The replaceable source is deprecated in OpenSSL 3; its successor takes a provider.
#define OPENSSL_SUPPRESS_DEPRECATED
#include "fixed_random.h"

#include <openssl/rand.h>

#include "input.h"

namespace Fuzz {
namespace {

std::uint64_t state = 0;

// SplitMix64, which spreads every seed.
std::uint64_t Next() {
  state += 0x9E3779B97F4A7C15;
  std::uint64_t mixed = state;
  mixed = (mixed ^ (mixed >> 30)) * 0xBF58476D1CE4E5B9;
  mixed = (mixed ^ (mixed >> 27)) * 0x94D049BB133111EB;
  return mixed ^ (mixed >> 31);
}

int Fill(unsigned char* bytes, int count) {
  for (int i = 0; i < count; ++i) {
    bytes[i] = static_cast<unsigned char>(Next() >> 56);
  }
  return 1;
}

int Status() {
  return 1;
}

}  // namespace

void FixRandomness(std::uint64_t seed) {
  static const RAND_METHOD method = {nullptr, Fill, nullptr, nullptr, Fill, Status};
  state = seed;
  Require(RAND_set_rand_method(&method) == 1);
}

}  // namespace Fuzz
