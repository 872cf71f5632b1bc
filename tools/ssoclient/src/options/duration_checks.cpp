#include "options/duration_checks.h"

#include "output/duration_text.h"

namespace SsoClient::Tool {

std::string CheckDuration(const std::string& text) {
  return ParseDuration(text) ? std::string()
                             : "'" + text + "' is not a duration such as 90s, 5m, 8h or 31d";
}

std::string CheckPositiveDuration(const std::string& text) {
  const std::string failure = CheckDuration(text);
  return failure.empty() && ParseDuration(text)->count() == 0 ? "it must not be 0" : failure;
}

}  // namespace SsoClient::Tool
