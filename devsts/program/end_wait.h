#ifndef DEVSTS_PROGRAM_END_WAIT_H
#define DEVSTS_PROGRAM_END_WAIT_H

#include <mutex>
#include <string>

#include "descriptor.h"
#include "event.h"

namespace DevSts::Program {

// Waits until the service has to end. Must be constructed before any other thread runs, since it
// blocks SIGTERM and SIGINT, which it receives from then on.
class EndWait {
 public:
  // Throws ProgramError.
  EndWait();

  // Asks for the end; from any thread.
  void Request();
  // Asks for the end because of an error; from any thread.
  void Fail(const std::string& message);

  // Returns after a signal or `Request`. Throws ProgramError with the first message after `Fail`.
  void Wait();

 private:
  Descriptor signals_;
  Event requested_;
  std::mutex mutex_;
  std::string failure_;
};

}  // namespace DevSts::Program

#endif
