#include "xml/output_buffer.h"

#include <openssl/crypto.h>

#include <algorithm>

namespace Tarnik::Xml {

namespace {

// Compared without branches, so that the compiler checks a block of characters in a few
// instructions; nearly all blocks of a document hold nothing to escape.
struct IsTextSpecial {
  constexpr bool operator()(char character) const noexcept {
    return (character == '&') | (character == '<') | (character == '>') | (character == '\r');
  }
};

struct IsAttributeSpecial {
  constexpr bool operator()(char character) const noexcept {
    return (character == '&') | (character == '<') | (character == '"') | (character == '\t') |
           (character == '\n') | (character == '\r');
  }
};

template <class IsSpecial>
std::size_t FindSpecial(std::string_view text, IsSpecial isSpecial) noexcept {
  constexpr std::size_t kBlock = 16;
  std::size_t position = 0;
  for (; text.size() - position >= kBlock; position += kBlock) {
    unsigned char found = 0;
    for (std::size_t index = 0; index < kBlock; ++index) {
      found |= static_cast<unsigned char>(isSpecial(text[position + index]));
    }
    if (found != 0) {
      break;
    }
  }
  while (position < text.size() && !isSpecial(text[position])) {
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
  OPENSSL_cleanse(buffer_.data(), std::max(mostUsed_, used_));
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
