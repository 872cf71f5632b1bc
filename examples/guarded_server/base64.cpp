#include "base64.h"

#include <algorithm>
#include <vector>

#include <tarnik/core/exception.h>
#include <tarnik/text/string_util.h>

namespace GuardedServer {

std::optional<std::string> DecodeBase64(std::string_view text) {
  std::string standard(text);
  std::replace(standard.begin(), standard.end(), '-', '+');
  std::replace(standard.begin(), standard.end(), '_', '/');
  const std::size_t padded = (standard.size() + 3) / 4 * 4;
  if (standard.find('=') == std::string::npos) {
    standard.resize(padded, '=');
  }
  try {
    std::vector<unsigned char> bytes;
    Tarnik::StringUtil::Base64Decode(standard, bytes);
    return std::string(bytes.begin(), bytes.end());
  } catch (const Tarnik::Base64FormatException&) {
    return std::nullopt;
  }
}

}  // namespace GuardedServer
