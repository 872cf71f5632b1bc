#ifndef SSOCLIENT_SUPPORT_SECRET_TEXT_H
#define SSOCLIENT_SUPPORT_SECRET_TEXT_H

#include <string>

#include <tarnik/text/string_util.h>

namespace SsoClient {

/// A text that is cleansed from memory when it dies.
struct SecretText {
  std::string text;

  SecretText() = default;
  explicit SecretText(const std::string& secret) : text(secret) {}
  SecretText(const SecretText&) = delete;
  SecretText& operator=(const SecretText&) = delete;
  ~SecretText() { Tarnik::StringUtil::Cleanse(text); }
};

}  // namespace SsoClient

#endif
