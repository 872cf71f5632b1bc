// What decodes is, but for white space, the one text that encodes to it.
#include <tarnik/core/exception.h>
#include <tarnik/text/string_util.h>

#include <algorithm>

#include "input.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  std::string text = Fuzz::TextOf(data, size);
  std::vector<unsigned char> bytes;
  try {
    Tarnik::StringUtil::Base64Decode(text, bytes);
  } catch (const Tarnik::Base64FormatException&) {
    return 0;
  }
  text.erase(std::remove_if(text.begin(), text.end(),
                            [](char c) { return c == ' ' || c == '\t' || c == '\r' || c == '\n'; }),
             text.end());
  Fuzz::Require(Tarnik::StringUtil::Base64Encode(bytes) == text);
  return 0;
}
