#ifndef SSOCLIENT_SUPPORT_CONCAT_H
#define SSOCLIENT_SUPPORT_CONCAT_H

#include <initializer_list>
#include <string>
#include <string_view>

namespace SsoClient {

/// Returns the parts joined in order, with one allocation.
inline std::string Concat(std::initializer_list<std::string_view> parts) {
  std::size_t size = 0;
  for (const std::string_view part : parts) {
    size += part.size();
  }
  std::string text;
  text.reserve(size);
  for (const std::string_view part : parts) {
    text.append(part);
  }
  return text;
}

}  // namespace SsoClient

#endif
