#ifndef SSOCLIENT_TESTS_CHAOS_PROCESS_STATE_H
#define SSOCLIENT_TESTS_CHAOS_PROCESS_STATE_H

#include <cstddef>
#include <map>
#include <string>

#include "chaos/run.h"

namespace SsoClient::Testing {

/// The descriptors and threads of this process. Workers of the pool end after ten seconds of
/// idleness, so they are counted apart from the other threads.
struct ProcessState {
  std::map<int, std::string> descriptors;
  std::size_t threads = 0;
  std::size_t workers = 0;

  static ProcessState Now();
  /// The state that stays the same for a tenth of a second: threads of connections that have ended
  /// may still be there a moment later.
  static ProcessState Settled();
};

/// Waits until the process has the descriptors and threads of `before` again. Closing a connection
/// is the work of other threads, so it may take a moment. With `areWorkersIncluded`, waits for the
/// end of idle workers as well.
void RequireState(const Run& run, const ProcessState& before, bool areWorkersIncluded);

}  // namespace SsoClient::Testing

#endif
