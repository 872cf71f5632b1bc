#ifndef SSOCLIENT_TOOL_INPUT_SECRET_TEXT_H
#define SSOCLIENT_TOOL_INPUT_SECRET_TEXT_H

#include <cstddef>
#include <string>

namespace SsoClient::Tool {

/// A text that is overwritten in memory when it is destroyed. It is never copied: growing and
/// moving leave no part of it in freed memory.
class SecretText {
 public:
  SecretText();
  ~SecretText();
  SecretText(SecretText&& other) noexcept;
  SecretText& operator=(SecretText&& other) noexcept;
  SecretText(const SecretText&) = delete;
  SecretText& operator=(const SecretText&) = delete;

  void Append(const char* data, std::size_t size);
  /// Overwrites and removes what is after the first `size` bytes.
  void Truncate(std::size_t size);
  /// Removes white space at both ends. What it removes is overwritten, too.
  void Trim();

  const std::string& Text() const noexcept { return text_; }

 private:
  std::string text_;
};

}  // namespace SsoClient::Tool

#endif
