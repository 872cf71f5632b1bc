#ifndef TARNIK_XML_NAME_CACHE_H
#define TARNIK_XML_NAME_CACHE_H

#include <array>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string_view>

#include "xml/interned_name.h"

namespace Tarnik::Xml {

/// Finds names that occurred before in a document. Each name has one slot, where a later name may
/// replace it: a document with colliding names costs memory but no time.
class NameCache {
 public:
  /// The slot of `name`, which contains that name, another one or null.
  const InternedName*& SlotOf(std::string_view name) noexcept {
    return slots_[Hash(name) % kSlots];
  }

 private:
  static constexpr std::size_t kSlots = 128;

  static std::size_t Hash(std::string_view name) noexcept {
    std::uint64_t first = 0;
    std::uint64_t last = 0;
    if (name.size() >= sizeof(first)) {
      std::memcpy(&first, name.data(), sizeof(first));
      std::memcpy(&last, name.data() + name.size() - sizeof(last), sizeof(last));
    } else {
      std::memcpy(&first, name.data(), name.size());
    }
    const std::uint64_t mixed =
        (first ^ (last << 7 | last >> 57) ^ name.size()) * 0x9E3779B97F4A7C15U;
    return static_cast<std::size_t>(mixed >> 48);
  }

  std::array<const InternedName*, kSlots> slots_{};
};

}  // namespace Tarnik::Xml

#endif
