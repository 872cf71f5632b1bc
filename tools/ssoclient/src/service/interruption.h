#ifndef SSOCLIENT_TOOL_SERVICE_INTERRUPTION_H
#define SSOCLIENT_TOOL_SERVICE_INTERRUPTION_H

#include <csignal>

#include "input/descriptor.h"

namespace SsoClient::Tool {

/// Holds the signals that ask the process to end (SIGINT, SIGTERM and SIGHUP) back, on this thread
/// and those that it starts, while it exists. Signals that the process ignores stay ignored.
class Interruption {
 public:
  /// Throws `std::system_error` when no descriptor is left.
  Interruption();
  ~Interruption();
  Interruption(const Interruption&) = delete;
  Interruption& operator=(const Interruption&) = delete;

  /// Is readable when there is a signal.
  int Waitable() const noexcept { return arrivals_.Get(); }
  /// The signal that has arrived, or 0.
  int Arrived();
  /// Ends the process by the signal, as if it had not been held back.
  [[noreturn]] void EndBy(int signal);

 private:
  sigset_t before_{};
  sigset_t held_{};
  Descriptor arrivals_;
};

}  // namespace SsoClient::Tool

#endif
