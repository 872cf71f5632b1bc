#ifndef TARNIK_SRC_XML_SHORT_TEXT_H
#define TARNIK_SRC_XML_SHORT_TEXT_H

#include <cstddef>
#include <string_view>

namespace Tarnik::Xml {

/// Whether two prefixes are the same. They have a few characters, for which the call of memcmp
/// would cost more than the comparison; and resolving prefixes compares them all the time.
inline bool EqualShort(std::string_view first, std::string_view second) noexcept {
  if (first.size() != second.size()) {
    return false;
  }
  for (std::size_t index = 0; index < first.size(); ++index) {
    if (first[index] != second[index]) {
      return false;
    }
  }
  return true;
}

}  // namespace Tarnik::Xml

#endif
