#include "base64.h"

#include <openssl/evp.h>

#include <algorithm>

#include "devsts/xml_security.h"

namespace DevSts {

std::string ToBase64(const std::vector<unsigned char>& octets) {
  std::string text(4 * ((octets.size() + 2) / 3) + 1, '\0');
  const int size = EVP_EncodeBlock(reinterpret_cast<unsigned char*>(text.data()), octets.data(),
                                   static_cast<int>(octets.size()));
  text.resize(static_cast<std::size_t>(size));
  return text;
}

std::vector<unsigned char> FromBase64(std::string text) {
  std::erase_if(text, [](char c) { return c == ' ' || c == '\t' || c == '\r' || c == '\n'; });
  const auto padding = static_cast<std::size_t>(std::count(text.begin(), text.end(), '='));
  std::vector<unsigned char> octets(text.size() / 4 * 3);
  const int size =
      EVP_DecodeBlock(octets.data(), reinterpret_cast<const unsigned char*>(text.data()),
                      static_cast<int>(text.size()));
  if (size < 0 || padding > 2 || text.size() % 4 != 0) {
    throw XmlError("not Base64");
  }
  octets.resize(static_cast<std::size_t>(size) - padding);
  return octets;
}

}  // namespace DevSts
