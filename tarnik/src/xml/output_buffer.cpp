#include "xml/output_buffer.h"

#include <algorithm>
#include <cstdint>

namespace Tarnik::Xml {

namespace {

// Sixteen characters are compared at once, since nearly all blocks of a document have nothing to
// escape.
constexpr std::size_t kBlock = 16;
using Block = unsigned char __attribute__((vector_size(kBlock)));

// The characters to escape, for single characters and for blocks.
struct IsTextSpecial {
  template <class T>
  auto operator()(const T& value) const noexcept {
    return (value == '&') | (value == '<') | (value == '>') | (value == '\r');
  }
};

struct IsAttributeSpecial {
  template <class T>
  auto operator()(const T& value) const noexcept {
    // The only characters below the blank in XML are tab, line feed and carriage return.
    return (value == '&') | (value == '<') | (value == '"') | (value < ' ');
  }
};

template <class IsSpecial>
bool IsPlainBlock(const char* text, IsSpecial isSpecial) noexcept {
  Block block;
  std::memcpy(&block, text, sizeof(block));
  const auto special = isSpecial(block);
  std::uint64_t halves[2];
  std::memcpy(halves, &special, sizeof(halves));
  return (halves[0] | halves[1]) == 0;
}

template <class IsSpecial>
std::size_t FindSpecial(std::string_view text, IsSpecial isSpecial) noexcept {
  std::size_t position = 0;
  while (text.size() - position >= kBlock && IsPlainBlock(text.data() + position, isSpecial)) {
    position += kBlock;
  }
  // The rest of a text longer than a block is checked as the last block of the text, which overlaps
  // with the one before. This is cheaper than checking its characters one by one.
  if (position > 0 && text.size() - position < kBlock &&
      IsPlainBlock(text.data() + text.size() - kBlock, isSpecial)) {
    return text.size();
  }
  while (position < text.size() && !isSpecial(static_cast<unsigned char>(text[position]))) {
    ++position;
  }
  return position;
}

std::string_view Escape(char character) noexcept {
  switch (character) {
    case '&':
      return "&amp;";
    case '<':
      return "&lt;";
    case '>':
      return "&gt;";
    case '"':
      return "&quot;";
    case '\t':
      return "&#x9;";
    case '\n':
      return "&#xA;";
    default:
      return "&#xD;";
  }
}

template <class IsSpecial>
void AppendEscaped(OutputBuffer& output, std::string_view text, IsSpecial isSpecial) {
  while (!text.empty()) {
    const std::size_t plain = FindSpecial(text, isSpecial);
    output.Append(text.substr(0, plain));
    if (plain == text.size()) {
      return;
    }
    output.Append(Escape(text[plain]));
    text.remove_prefix(plain + 1);
  }
}

}  // namespace

OutputBuffer::~OutputBuffer() {
  explicit_bzero(buffer_.data(), std::max(mostUsed_, used_));
}

void OutputBuffer::AppendText(std::string_view text) {
  AppendEscaped(*this, text, IsTextSpecial());
}

void OutputBuffer::AppendAttributeValue(std::string_view value) {
  AppendEscaped(*this, value, IsAttributeSpecial());
}

void OutputBuffer::AppendComment(std::string_view text) {
  Append("<!--");
  Append(text);
  Append("-->");
}

void OutputBuffer::AppendProcessingInstruction(std::string_view target, std::string_view text) {
  Append("<?");
  Append(target);
  if (!text.empty()) {
    Append(' ');
    Append(text);
  }
  Append("?>");
}

void OutputBuffer::AppendLarge(std::string_view text) {
  Flush();
  if (text.size() > buffer_.size()) {
    writer_.Write(text);
    return;
  }
  Append(text);
}

void OutputBuffer::Flush() {
  if (used_ == 0) {
    return;
  }
  mostUsed_ = std::max(mostUsed_, used_);
  const std::size_t used = used_;
  used_ = 0;
  writer_.Write({buffer_.data(), used});
}

}  // namespace Tarnik::Xml
