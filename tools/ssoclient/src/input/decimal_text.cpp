#include "input/decimal_text.h"

namespace SsoClient::Tool {

bool IsDecimal(std::string_view text, std::size_t mostDigits) {
  const bool isOctal = text.size() > 1 && text.front() == '0';
  return !text.empty() && !isOctal && text.size() <= mostDigits &&
         text.find_first_not_of("0123456789") == std::string_view::npos;
}

}  // namespace SsoClient::Tool
