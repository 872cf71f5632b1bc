#include "output/bar.h"

#include <algorithm>

namespace SsoClient::Tool {
namespace {

struct Glyphs {
  const char* begin;
  const char* passed;
  const char* now;
  const char* left;
  const char* end;
};

constexpr Glyphs kAscii{"[", "=", "|", "-", "]"};
constexpr Glyphs kUnicode{"├", "━", "●", "─", "┤"};

std::string Repeated(const char* glyph, std::size_t count) {
  std::string text;
  for (std::size_t i = 0; i < count; ++i) {
    text += glyph;
  }
  return text;
}

}  // namespace

std::string PeriodBar(double position, std::size_t width, bool isUtf8) {
  const Glyphs& glyphs = isUtf8 ? kUnicode : kAscii;
  const std::size_t inside = std::max<std::size_t>(width, 8) - 4;
  // The marker outside takes two columns with its space, on either side of the bar.
  if (position < 0) {
    return std::string(glyphs.now) + " " + glyphs.begin + Repeated(glyphs.left, inside) +
           glyphs.end;
  }
  if (position >= 1) {
    return glyphs.begin + Repeated(glyphs.passed, inside) + glyphs.end + " " + glyphs.now;
  }
  const auto passed = static_cast<std::size_t>(position * static_cast<double>(inside + 2));
  return glyphs.begin + Repeated(glyphs.passed, passed) + glyphs.now +
         Repeated(glyphs.left, inside + 1 - passed) + glyphs.end;
}

}  // namespace SsoClient::Tool
