#ifndef FUZZ_FIXED_RANDOM_H
#define FUZZ_FIXED_RANDOM_H

#include <cstdint>

namespace Fuzz {

/// Replaces OpenSSL's random numbers in this process by a sequence that `seed` determines, so that
/// an input always has the same keys, nonces and padding. Called again, starts the sequence again.
void FixRandomness(std::uint64_t seed);

}  // namespace Fuzz

#endif
