#include "output/console.h"

#include <algorithm>
#include <cctype>
#include <cstdlib>
#include <iostream>

#include <sys/ioctl.h>
#include <unistd.h>

namespace SsoClient::Tool {
namespace {

constexpr int kDefaultColumns = 80;

// ECMA-48, section 8.3.117.
const char* CodeOf(Colour colour) {
  switch (colour) {
    case Colour::kGood:
      return "32";
    case Colour::kBad:
      return "31";
    case Colour::kWarning:
      return "33";
    case Colour::kFaint:
      return "2";
    case Colour::kStrong:
      return "1";
  }
  return "0";
}

std::string Painted(bool hasColours, Colour colour, std::string_view text) {
  if (!hasColours || text.empty()) {
    return std::string(text);
  }
  return "\x1b[" + std::string(CodeOf(colour)) + "m" + std::string(text) + "\x1b[0m";
}

bool AreColoursWelcome() {
  // https://no-color.org: any value that is not empty.
  const char* refused = std::getenv("NO_COLOR");
  const char* terminal = std::getenv("TERM");
  return (refused == nullptr || *refused == '\0') &&
         (terminal == nullptr || std::string_view(terminal) != "dumb");
}

// By the name of the locale, since the locale itself need not be installed on a server. The first
// variable that is set counts (POSIX.1-2017, base definitions, section 8.2).
bool IsLocaleUtf8() {
  for (const char* variable : {"LC_ALL", "LC_CTYPE", "LANG"}) {
    const char* value = std::getenv(variable);
    if (value == nullptr || *value == '\0') {
      continue;
    }
    std::string name(value);
    name.erase(std::remove(name.begin(), name.end(), '-'), name.end());
    std::transform(name.begin(), name.end(), name.begin(),
                   [](unsigned char c) { return static_cast<char>(std::tolower(c)); });
    return name.find(".utf8") != std::string::npos;
  }
  return false;
}

}  // namespace

int ColumnsOfTerminal(int descriptor) {
  winsize size{};
  const bool isKnown = ioctl(descriptor, TIOCGWINSZ, &size) == 0 && size.ws_col > 0;
  return isKnown ? size.ws_col : kDefaultColumns;
}

Console Console::OfProcess() {
  const bool outIsTerminal = isatty(STDOUT_FILENO) == 1;
  const bool errIsTerminal = isatty(STDERR_FILENO) == 1;
  const bool welcome = AreColoursWelcome();
  return {.out = std::cout,
          .err = std::cerr,
          .outIsTerminal = outIsTerminal,
          .errIsTerminal = errIsTerminal,
          .outHasColours = outIsTerminal && welcome,
          .errHasColours = errIsTerminal && welcome,
          .columns = ColumnsOfTerminal(STDOUT_FILENO),
          .isUtf8 = IsLocaleUtf8()};
}

std::string Console::Paint(Colour colour, std::string_view text) const {
  return Painted(outHasColours, colour, text);
}

std::string Console::PaintError(Colour colour, std::string_view text) const {
  return Painted(errHasColours, colour, text);
}

}  // namespace SsoClient::Tool
