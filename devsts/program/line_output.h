#ifndef DEVSTS_PROGRAM_LINE_OUTPUT_H
#define DEVSTS_PROGRAM_LINE_OUTPUT_H

#include <condition_variable>
#include <cstdint>
#include <mutex>
#include <string>
#include <thread>

#include "event.h"

namespace DevSts::Program {

// Lines of text for a file descriptor, from any thread. What the reader of a pipe or a terminal
// does not take at once is kept and written later by a thread of its own, so that a reader that has
// stopped blocks nobody.
class LineOutput {
 public:
  // `descriptor` is not closed. Lines are kept until `Start`. Throws ProgramError.
  explicit LineOutput(int descriptor);
  // Writes what the reader takes within a moment, and discards the rest.
  ~LineOutput();
  LineOutput(const LineOutput&) = delete;
  LineOutput& operator=(const LineOutput&) = delete;

  // From one thread, once. Throws std::system_error if there is no thread.
  void Start();

  // Never waits. If more than a megabyte is kept, the line is lost, and the line "requests-lost=N"
  // takes the place of all that were lost in succession.
  void Write(const std::string& line);
  // Waits until less is kept, or for `EndWaits`, and then never loses the line.
  void WriteEach(const std::string& line);
  // Ends the calls of `WriteEach` that wait, also later ones.
  void EndWaits();

 private:
  void WriteUntilStopped();
  // For callers that hold the mutex.
  bool IsFull() const;
  void Append(const std::string& line);
  void WriteWhatIsTaken();

  int descriptor_;
  bool started_ = false;
  bool stopped_ = false;
  bool waitsEnded_ = false;
  std::uint64_t lost_ = 0;
  std::string kept_;
  std::mutex mutex_;  // of the members above
  std::condition_variable changed_;
  Event woken_;
  Descriptor unblocked_;
  std::thread thread_;
};

}  // namespace DevSts::Program

#endif
