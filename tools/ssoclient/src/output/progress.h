#ifndef SSOCLIENT_TOOL_OUTPUT_PROGRESS_H
#define SSOCLIENT_TOOL_OUTPUT_PROGRESS_H

#include <cstddef>
#include <string>

#include "output/console.h"

namespace SsoClient::Tool {

/// A line on the terminal of `console.err` that says what the program waits for. Without a terminal
/// it does nothing.
class ProgressLine {
 public:
  explicit ProgressLine(const Console& console) : console_(console) {}
  /// Removes the line.
  ~ProgressLine() { Clear(); }
  ProgressLine(const ProgressLine&) = delete;
  ProgressLine& operator=(const ProgressLine&) = delete;

  /// Replaces the line. What is too long for the terminal is left out.
  void Show(const std::string& text);
  void Clear();

 private:
  const Console& console_;
  std::size_t shown_ = 0;
};

}  // namespace SsoClient::Tool

#endif
