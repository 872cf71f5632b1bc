#ifndef TARNIK_XML_EQUAL_PREFIXES_H
#define TARNIK_XML_EQUAL_PREFIXES_H

#include <cstddef>
#include <string_view>

namespace Tarnik::Xml {

/// True when two prefixes are equal. Prefixes are short and compared very often, so a call of
/// memcmp would cost more than this loop.
inline bool EqualPrefixes(std::string_view first, std::string_view second) noexcept {
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
