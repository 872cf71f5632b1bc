// Apart from white space, a text that can be decoded is the only encoding of its bytes. All bytes
// can be encoded and decoded again. OpenSSL refuses every text that is refused here.
#include <algorithm>

#include <openssl/evp.h>

#include <tarnik/core/exception.h>
#include <tarnik/text/base64.h>
#include <tarnik/text/string_util.h>

#include "input.h"

namespace {

using Bytes = std::vector<unsigned char>;

std::string WithoutWhiteSpace(std::string text) {
  std::erase_if(text, [](char c) { return c == ' ' || c == '\t' || c == '\r' || c == '\n'; });
  return text;
}

bool Decode(const std::string& text, Bytes& bytes) {
  try {
    Tarnik::StringUtil::Base64Decode(text, bytes);
    return true;
  } catch (const Tarnik::Base64FormatException&) {
    return false;
  }
}

// OpenSSL ignores blanks at both ends and unused bits after the last byte, so only a text that it
// writes itself counts as Base64.
bool IsBase64ForOpenSsl(const std::string& text) {
  const auto padding = static_cast<std::size_t>(
      std::find_if(text.rbegin(), text.rend(), [](char c) { return c != '='; }) - text.rbegin());
  Bytes bytes(text.size());
  const auto* symbols = reinterpret_cast<const unsigned char*>(text.data());
  const int count = EVP_DecodeBlock(bytes.data(), symbols, static_cast<int>(text.size()));
  if (count < 0 || padding > 2 || static_cast<std::size_t>(count) < padding) {
    return false;
  }
  const int size = count - static_cast<int>(padding);
  Bytes again(text.size() + 5);
  const int written = EVP_EncodeBlock(again.data(), bytes.data(), size);
  return std::string(again.begin(), again.begin() + written) == text;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  const std::string text = Fuzz::TextOf(data, size);
  const std::string symbols = WithoutWhiteSpace(text);
  Bytes bytes;
  const bool isDecoded = Decode(text, bytes);
  Fuzz::Require(isDecoded == IsBase64ForOpenSsl(symbols));
  Fuzz::Require(!isDecoded || Tarnik::StringUtil::Base64Encode(bytes) == symbols);

  const Bytes original(data, data + size);
  const std::string encoded = Tarnik::StringUtil::Base64Encode(original);
  std::string written(Tarnik::Base64_EncodedLength(data, size), '\0');
  std::size_t length = 0;
  Tarnik::Base64_Encode(data, size, written.data(), written.size(), &length);
  Fuzz::Require(length == written.size() && written == encoded);
  Bytes decoded;
  Fuzz::Require(Decode(encoded, decoded) && decoded == original);
  return 0;
}
