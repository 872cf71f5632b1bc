#ifndef DEVSTS_KERBEROS_CHILD_PROCESS_H
#define DEVSTS_KERBEROS_CHILD_PROCESS_H

#include <string>
#include <vector>

#include <sys/types.h>

namespace DevSts {

/// A program with its arguments. It runs with the variables, each "NAME=value", added to the
/// environment, and its output goes to a file. It is killed at the latest when the thread that
/// started it ends.
struct Command {
  std::vector<std::string> arguments;
  std::vector<std::string> variables;
  std::string outputPath;
  std::string input;  ///< for its standard input
};

/// Runs the command and waits until it ends. Throws `std::runtime_error` with its output if it
/// fails.
void RunToEnd(const Command& command);

/// A process in the background. The destructor ends it with SIGTERM or, after a time-out, with
/// SIGKILL.
class BackgroundProcess {
 public:
  explicit BackgroundProcess(const Command& command);
  ~BackgroundProcess();
  BackgroundProcess(const BackgroundProcess&) = delete;
  BackgroundProcess& operator=(const BackgroundProcess&) = delete;

  pid_t Id() const { return process_; }
  bool IsRunning();

 private:
  pid_t process_;
  bool hasEnded_ = false;
};

}  // namespace DevSts

#endif
