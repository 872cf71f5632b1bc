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
  return "'" + std::string(text) + "'";
}

}  // namespace Tarnik
