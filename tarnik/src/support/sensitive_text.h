#ifndef TARNIK_SUPPORT_SENSITIVE_TEXT_H
#define TARNIK_SUPPORT_SENSITIVE_TEXT_H

#include <algorithm>
#include <string>
#include <string_view>

#include "support/cleanse.h"

namespace Tarnik {

/// Bytes that may contain passwords, keys or tokens. No copy stays in memory when the text is
/// destroyed or outgrows its buffer.
class SensitiveText {
 public:
  SensitiveText() = default;
  SensitiveText(const SensitiveText&) = delete;
  SensitiveText& operator=(const SensitiveText&) = delete;
  ~SensitiveText() { Clear(); }

  void Reserve(std::size_t capacity) {
    if (capacity <= text_.capacity()) {
      return;
    }
    std::string larger;
    larger.reserve(capacity);
    larger.assign(text_);
    text_.swap(larger);
    CleanseBuffer(larger);
  }

  void Append(std::string_view more) {
    if (text_.capacity() - text_.size() < more.size()) {
      Reserve(std::max(text_.size() + more.size(), 2 * text_.capacity()));
    }
    text_.append(more);
  }

  /// Drops the first `count` bytes; the others move to the front.
  void RemovePrefix(std::size_t count) {
    if (count == 0) {
      return;
    }
    if (count == text_.size()) {
      Clear();
      return;
    }
    std::string rest(text_, count);
    text_.swap(rest);
    CleanseBuffer(rest);
  }

  void Clear() noexcept { CleanseBuffer(text_); }

  /// Moves the bytes to the caller, who must cleanse them.
  std::string Take() noexcept {
    std::string taken;
    taken.swap(text_);
    Clear();  // a short text was copied out of the string object
    return taken;
  }

  const std::string& Text() const noexcept { return text_; }
  std::size_t Size() const noexcept { return text_.size(); }

 private:
  std::string text_;
};

}  // namespace Tarnik

#endif
