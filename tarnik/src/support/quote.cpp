#include "support/quote.h"

#include <cstddef>

namespace Tarnik {
namespace {

constexpr std::size_t kMaxQuotedLength = 120;

}  // namespace

std::string Quote(std::string_view text) {
  const bool cut = text.size() > kMaxQuotedLength;
  std::string quoted("'");
  for (const char c : text.substr(0, kMaxQuotedLength)) {
    quoted.push_back(c >= ' ' && c <= '~' ? c : '?');
  }
  return quoted.append(cut ? "...'" : "'");
}

std::string QuoteVerbatim(std::string_view text) {
  if (text.size() <= kMaxQuotedLength) {
    return "'" + std::string(text) + "'";
  }
  std::size_t end = kMaxQuotedLength;
  while (end > 0 && (static_cast<unsigned char>(text[end]) & 0xC0) == 0x80) {
    --end;  // within a character of UTF-8
  }
  return "'" + std::string(text.substr(0, end)) + "...'";
}

}  // namespace Tarnik
