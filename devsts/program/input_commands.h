#ifndef DEVSTS_PROGRAM_INPUT_COMMANDS_H
#define DEVSTS_PROGRAM_INPUT_COMMANDS_H

#include <functional>
#include <string>
#include <thread>

#include "event.h"

namespace DevSts::Program {

// Reads the lines of standard input on a thread of its own, so that a command that waits does not
// delay signals.
class InputCommands {
 public:
  // Calls `execute` with each line until it returns false or the input ends, then `ended`.
  InputCommands(std::function<bool(const std::string& line)> execute, std::function<void()> ended);
  // Waits until `execute` returns, and does not wait for input.
  ~InputCommands();
  InputCommands(const InputCommands&) = delete;
  InputCommands& operator=(const InputCommands&) = delete;

 private:
  void ReadUntilEnd();
  // Waits for input. Returns false if there is no more to read.
  bool ReadMore();
  // Executes the complete lines and removes them. Returns false if one of them ends the service.
  bool ExecuteLines();

  std::function<bool(const std::string&)> execute_;
  std::function<void()> ended_;
  std::string text_;
  Event stopped_;
  std::thread thread_;
};

}  // namespace DevSts::Program

#endif
