#ifndef DEVSTS_PROGRAM_ERRORS_H
#define DEVSTS_PROGRAM_ERRORS_H

#include <stdexcept>
#include <string>

namespace DevSts::Program {

// The exit statuses of the program.
enum class ExitStatus {
  Ended = 0,  // on request
  Failed = 1,
  Usage = 2,  // wrong options or a wrong accounts file
  Port = 3,   // a port is in use or cannot be opened
  Files = 4,  // a file or folder is missing, in use, broken or cannot be written
};

// An error that ends the program with a status of its own.
class ProgramError : public std::runtime_error {
 public:
  ProgramError(ExitStatus status, const std::string& message)
      : std::runtime_error(message), status_(status) {}

  ExitStatus Status() const { return status_; }

 private:
  ExitStatus status_;
};

class UsageError : public ProgramError {
 public:
  explicit UsageError(const std::string& message) : ProgramError(ExitStatus::Usage, message) {}
};

class FileError : public ProgramError {
 public:
  explicit FileError(const std::string& message) : ProgramError(ExitStatus::Files, message) {}
};

}  // namespace DevSts::Program

#endif
