#include "output/count_text.h"

namespace SsoClient::Tool {

std::string CountText(long count, const std::string& noun, const std::string& pluralEnding) {
  return std::to_string(count) + " " + noun + (count == 1 ? "" : pluralEnding);
}

}  // namespace SsoClient::Tool
