#ifndef SSOCLIENT_TOOL_OUTPUT_CONSOLE_H
#define SSOCLIENT_TOOL_OUTPUT_CONSOLE_H

#include <iosfwd>
#include <string>
#include <string_view>

namespace SsoClient::Tool {

enum class Colour { kGood, kBad, kWarning, kFaint, kStrong };

/// The columns of the terminal of this descriptor; 80 if it has none.
int ColumnsOfTerminal(int descriptor);

/// Where a command writes. Results go to `out`, progress and failures to `err`.
struct Console {
  std::ostream& out;
  std::ostream& err;
  bool outIsTerminal = false;
  bool errIsTerminal = false;
  /// Whether results are coloured; never without a terminal, nor with NO_COLOR.
  bool outHasColours = false;
  bool errHasColours = false;
  /// The columns of the terminal, 80 without one.
  int columns = 80;
  /// Whether the locale's characters are UTF-8; otherwise only ASCII is written.
  bool isUtf8 = false;

  /// The console of this process.
  static Console OfProcess();

  /// The text, in the colour if results are coloured.
  std::string Paint(Colour colour, std::string_view text) const;
  /// The same for `err`.
  std::string PaintError(Colour colour, std::string_view text) const;
};

}  // namespace SsoClient::Tool

#endif
