#ifndef SSOCLIENT_TESTS_SUPPORT_HOLDS_TEXT_H
#define SSOCLIENT_TESTS_SUPPORT_HOLDS_TEXT_H

#include <algorithm>
#include <array>
#include <cstddef>
#include <string_view>

namespace SsoClient::Testing {

/// True when `storage`, which may hold a destroyed object, contains the bytes of `text`.
template <std::size_t size>
bool HoldsText(const std::array<unsigned char, size>& storage, std::string_view text) {
  return std::search(storage.begin(), storage.end(), text.begin(), text.end()) != storage.end();
}

}  // namespace SsoClient::Testing

#endif
