#ifndef SSOCLIENT_TOOL_SERVICE_LIBRARY_LOG_H
#define SSOCLIENT_TOOL_SERVICE_LIBRARY_LOG_H

#include <memory>
#include <string_view>

#include "output/console.h"

namespace SsoClient::Tool {

/// Collects the lines of the libraries' log: written at once, they would be in the middle of the
/// progress. Later lines, of a call that was abandoned, are dropped. There is one at a time.
class LibraryLog {
 public:
  LibraryLog();
  ~LibraryLog();
  LibraryLog(const LibraryLog&) = delete;
  LibraryLog& operator=(const LibraryLog&) = delete;

  /// Writes the lines to `console.err`, but not those that contain `secret`, if it is not empty,
  /// and not the client's line about the empty answer to the last leg of a negotiation: it is
  /// written for each login with Kerberos that succeeds, and users could take it for a failure.
  void Print(const Console& console, std::string_view secret) const;

 private:
  struct Lines;
  std::shared_ptr<Lines> lines_;
};

}  // namespace SsoClient::Tool

#endif
