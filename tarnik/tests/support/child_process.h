#ifndef TARNIK_TESTS_SUPPORT_CHILD_PROCESS_H
#define TARNIK_TESTS_SUPPORT_CHILD_PROCESS_H

#include <chrono>
#include <string>
#include <vector>

namespace Tarnik::Testing {

struct RunOptions {
  /// A program that takes longer is killed.
  std::chrono::milliseconds limit = std::chrono::minutes(5);
  /// LeakSanitizer does not check the program: it takes what the threads of a parent refer to for
  /// leaks of a forked child.
  bool isLeakCheckOff = false;
};

/// Runs a program with these words as its path and arguments. Returns its exit status, or 128 plus
/// the number of the signal that ended it. Throws `std::runtime_error` if it cannot be started.
int RunToEnd(std::vector<std::string> command, const RunOptions& options = {});

struct CommandResult {
  /// As `RunToEnd` returns it.
  int status = -1;
  /// The standard output.
  std::string output;
};

/// Runs a command line of the shell. Throws `std::runtime_error` if there is no shell.
CommandResult RunInShell(const std::string& line);

}  // namespace Tarnik::Testing

#endif
