#ifndef DEVSTS_KERBEROS_CHILD_PROCESS_H
#define DEVSTS_KERBEROS_CHILD_PROCESS_H

#include <sys/types.h>

#include <string>
#include <vector>

namespace DevSts {

/// A program with its arguments, run with the variables "NAME=value" added to the environment. Its
/// output goes to a file. It ends with the thread that starts it, at the latest.
struct Command {
  std::vector<std::string> arguments;
  std::vector<std::string> variables;
  std::string outputPath;
  std::string input;  ///< for its standard input
};

/// Runs the command to its end. Throws `std::runtime_error` with its output when it fails.
void RunToEnd(const Command& command);

/// A process in the background. Ends with this object: asked to at first, killed after a while.
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
