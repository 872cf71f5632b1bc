#include "output/text_width.h"

#include <algorithm>
#include <cwchar>

#include <locale.h>

namespace SsoClient::Tool {
namespace {

std::size_t SequenceLength(unsigned char first) {
  if (first >= 0xC2 && first <= 0xDF) {
    return 2;
  }
  if (first >= 0xE0 && first <= 0xEF) {
    return 3;
  }
  return first >= 0xF0 && first <= 0xF4 ? 4 : 1;
}

bool IsContinuation(char byte) {
  return (static_cast<unsigned char>(byte) & 0xC0) == 0x80;
}

// The widths of characters in UTF-8, whatever the locale of the user is.
class WidthTable {
 public:
  WidthTable() : locale_(newlocale(LC_CTYPE_MASK, "C.UTF-8", nullptr)) {}
  ~WidthTable() {
    if (locale_ != nullptr) {
      freelocale(locale_);
    }
  }
  WidthTable(const WidthTable&) = delete;
  WidthTable& operator=(const WidthTable&) = delete;

  std::size_t WidthOf(char32_t codePoint) const {
    if (locale_ == nullptr || codePoint < 0x80) {
      return 1;
    }
    const locale_t previous = uselocale(locale_);
    const int width = wcwidth(static_cast<wchar_t>(codePoint));
    uselocale(previous);
    return width < 0 ? 1 : static_cast<std::size_t>(width);
  }

 private:
  locale_t locale_;
};

// The longest start of `text` that takes at most `width` columns; at least one character.
std::size_t FittingLength(std::string_view text, std::size_t width) {
  std::size_t length = 0;
  std::size_t used = 0;
  while (length < text.size()) {
    const std::string_view rest = text.substr(length);
    const std::size_t next = FirstCharacterLength(rest);
    used += DisplayWidth(rest.substr(0, next));
    if (used > width && length > 0) {
      break;
    }
    length += next;
  }
  return length;
}

void WrapParagraph(std::string_view text, std::size_t width, std::vector<std::string>& lines) {
  while (DisplayWidth(text) > width) {
    const std::size_t fitting = FittingLength(text, width);
    const std::size_t space = text.substr(0, fitting + 1).rfind(' ');
    const bool isAtSpace = space != std::string_view::npos && space > 0;
    lines.emplace_back(text.substr(0, isAtSpace ? space : fitting));
    text.remove_prefix(isAtSpace ? space : fitting);
    text.remove_prefix(std::min(text.find_first_not_of(' '), text.size()));
    if (text.empty()) {
      return;
    }
  }
  lines.emplace_back(text);
}

}  // namespace

std::size_t FirstCharacterLength(std::string_view text) {
  const std::size_t length = SequenceLength(static_cast<unsigned char>(text.front()));
  const bool isWhole =
      length <= text.size() &&
      std::all_of(text.begin() + 1, text.begin() + static_cast<long>(length), IsContinuation);
  return isWhole ? length : 1;
}

char32_t CodePointOf(std::string_view character) {
  const auto first = static_cast<unsigned char>(character.front());
  if (character.size() == 1) {
    return first;
  }
  char32_t codePoint = first & (0xFFU >> (character.size() + 1));
  for (const char byte : character.substr(1)) {
    codePoint = (codePoint << 6) | (static_cast<unsigned char>(byte) & 0x3FU);
  }
  return codePoint;
}

std::size_t DisplayWidth(std::string_view text) {
  static const WidthTable table;
  std::size_t width = 0;
  while (!text.empty()) {
    const std::size_t length = FirstCharacterLength(text);
    width += table.WidthOf(length == 1 ? U'?' : CodePointOf(text.substr(0, length)));
    text.remove_prefix(length);
  }
  return width;
}

std::string PaddedTo(std::string_view text, std::size_t width) {
  const std::size_t own = DisplayWidth(text);
  return std::string(text) + std::string(own < width ? width - own : 0, ' ');
}

std::vector<std::string> WrappedLines(std::string_view text, std::size_t width) {
  std::vector<std::string> lines;
  for (;;) {
    const std::size_t end = text.find('\n');
    WrapParagraph(text.substr(0, end), width, lines);
    if (end == std::string_view::npos) {
      return lines;
    }
    text.remove_prefix(end + 1);
  }
}

}  // namespace SsoClient::Tool
