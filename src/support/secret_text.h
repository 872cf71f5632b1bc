#ifndef SSOCLIENT_SUPPORT_SECRET_TEXT_H
#define SSOCLIENT_SUPPORT_SECRET_TEXT_H

#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include <tarnik/text/string_util.h>

namespace SsoClient {

/// Text that is cleansed from memory when it is destroyed: a password, a token, a request.
struct SecretText {
  std::string text;

  SecretText() = default;
  explicit SecretText(std::string_view secret) : text(secret) {}
  SecretText(const SecretText&) = delete;
  SecretText& operator=(const SecretText&) = delete;
  ~SecretText() { Tarnik::StringUtil::Cleanse(text); }
};

/// The same for bytes: a leg of a negotiation.
struct SecretBytes {
  std::vector<unsigned char> bytes;

  explicit SecretBytes(std::vector<unsigned char> secret) : bytes(std::move(secret)) {}
  SecretBytes(const SecretBytes&) = delete;
  SecretBytes& operator=(const SecretBytes&) = delete;
  ~SecretBytes() { Tarnik::StringUtil::Cleanse(bytes); }
};

}  // namespace SsoClient

#endif
