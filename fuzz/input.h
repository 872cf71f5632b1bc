#ifndef FUZZ_INPUT_H
#define FUZZ_INPUT_H

#include <cstddef>
#include <cstdint>
#include <string>

namespace Fuzz {

inline std::string TextOf(const std::uint8_t* data, std::size_t size) {
  return {reinterpret_cast<const char*>(data), size};
}

/// Unless `holds`, crashes the process, so that libFuzzer keeps the input.
inline void Require(bool holds) {
  if (!holds) {
    __builtin_trap();
  }
}

}  // namespace Fuzz

#endif
