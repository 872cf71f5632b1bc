#include "plain_text.h"

#include <algorithm>

namespace SsoClient {

namespace {

constexpr std::size_t kMaxLength = 500;

bool IsControl(char c) {
  const auto byte = static_cast<unsigned char>(c);
  return byte < 0x20 || byte == 0x7f;
}

}  // namespace

std::string PlainText(std::string_view text) {
  while (!text.empty() && (text.back() == ' ' || IsControl(text.back()))) {
    text.remove_suffix(1);
  }
  std::string plain(text.substr(0, kMaxLength));
  std::replace_if(plain.begin(), plain.end(), IsControl, '?');
  return text.size() > kMaxLength ? plain + "..." : plain;
}

}  // namespace SsoClient
