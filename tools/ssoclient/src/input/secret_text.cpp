#include "input/secret_text.h"

#include <algorithm>
#include <utility>

#include <tarnik/text/string_util.h>

namespace SsoClient::Tool {
namespace {

// More than a string keeps in itself, so that moving it copies no byte.
constexpr std::size_t kLeastCapacity = 64;

constexpr const char* kWhiteSpace = "\t\n\r ";

}  // namespace

SecretText::SecretText() {
  text_.reserve(kLeastCapacity);
}

SecretText::~SecretText() {
  Tarnik::StringUtil::Cleanse(text_);
}

SecretText::SecretText(SecretText&& other) noexcept : text_(std::move(other.text_)) {}

SecretText& SecretText::operator=(SecretText&& other) noexcept {
  text_.swap(other.text_);
  return *this;
}

void SecretText::Append(const char* data, std::size_t size) {
  if (text_.size() + size > text_.capacity()) {
    std::string larger;
    larger.reserve(std::max(2 * (text_.size() + size), kLeastCapacity));
    larger.append(text_);
    text_.swap(larger);
    Tarnik::StringUtil::Cleanse(larger);
  }
  text_.append(data, size);
}

void SecretText::Truncate(std::size_t size) {
  if (size < text_.size()) {
    std::fill(text_.begin() + static_cast<std::ptrdiff_t>(size), text_.end(), '\0');
    text_.resize(size);
  }
}

void SecretText::Trim() {
  const std::size_t last = text_.find_last_not_of(kWhiteSpace);
  Truncate(last == std::string::npos ? 0 : last + 1);
  const std::size_t first = text_.find_first_not_of(kWhiteSpace);
  if (first != std::string::npos) {
    std::move(text_.begin() + static_cast<std::ptrdiff_t>(first), text_.end(), text_.begin());
    Truncate(text_.size() - first);
  }
}

}  // namespace SsoClient::Tool
