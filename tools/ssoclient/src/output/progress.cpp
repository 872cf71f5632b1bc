#include "output/progress.h"

#include <algorithm>
#include <ostream>

#include <unistd.h>

namespace SsoClient::Tool {

void ProgressLine::Show(const std::string& text) {
  if (!console_.errIsTerminal) {
    return;
  }
  // In the last column, some terminals would begin another line.
  const auto columns = static_cast<std::size_t>(ColumnsOfTerminal(STDERR_FILENO));
  const std::string line = text.substr(0, columns - 1);
  // Blanks overwrite what the last line was longer by, also on a terminal without control codes.
  console_.err << '\r' << line << std::string(shown_ - std::min(shown_, line.size()), ' ')
               << std::flush;
  shown_ = std::max(shown_, line.size());
}

void ProgressLine::Clear() {
  if (shown_ > 0) {
    console_.err << '\r' << std::string(shown_, ' ') << '\r' << std::flush;
    shown_ = 0;
  }
}

}  // namespace SsoClient::Tool
