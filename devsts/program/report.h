#ifndef DEVSTS_PROGRAM_REPORT_H
#define DEVSTS_PROGRAM_REPORT_H

#include <mutex>
#include <string>

#include "devsts/server.h"
#include "files.h"

namespace DevSts::Program {

// Lines of text for a file descriptor; one at a time, from any thread.
class LineOutput {
 public:
  // `descriptor` is not closed; -1 discards the lines.
  explicit LineOutput(int descriptor) : descriptor_(descriptor) {}

  void Write(const std::string& line);

 private:
  std::mutex mutex_;
  const int descriptor_;
};

// The properties of a request as NAME=VALUE, without its body, which contains passwords.
std::string DescribeRequest(const ReceivedRequest& request);
// The counters as NAME=VALUE.
std::string DescribeCounters(const Counters& counters);
// The counter with this name. Throws std::invalid_argument for an unknown name.
std::uint64_t CounterNamed(const std::string& name, const Counters& counters);

}  // namespace DevSts::Program

#endif
