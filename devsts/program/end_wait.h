#ifndef DEVSTS_PROGRAM_END_WAIT_H
#define DEVSTS_PROGRAM_END_WAIT_H

#include <functional>
#include <string>

#include "files.h"

namespace DevSts::Program {

// Waits until the service is asked to end. Must be constructed before any other thread runs, since
// it blocks SIGTERM and SIGINT, which it receives from then on.
class EndWait {
 public:
  EndWait();

  // Asks for the end; from any thread.
  void Request();

  // Returns after a signal or `Request`; with standard input, also when it ends or `execute`, which
  // is called with each of its lines, returns false.
  void Wait(bool withStdin, const std::function<bool(const std::string& line)>& execute);

 private:
  Descriptor signals_;
  Descriptor requested_;
};

}  // namespace DevSts::Program

#endif
