#include "service/http_date.h"

#include <ctime>

#include <time.h>

namespace SsoClient::Tool {

std::optional<long> ParseHttpDate(const std::string& text) {
  std::tm fields{};
  // The program never sets a locale, so that the names are English.
  const char* const end = strptime(text.c_str(), "%a, %d %b %Y %H:%M:%S GMT", &fields);
  return end != nullptr && *end == '\0' ? std::optional<long>(timegm(&fields)) : std::nullopt;
}

}  // namespace SsoClient::Tool
