#ifndef DEVSTS_PROGRAM_PROCESS_H
#define DEVSTS_PROGRAM_PROCESS_H

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

#include <sys/types.h>

namespace DevSts::Testing {

// A folder that the destructor removes, with everything in it.
class ScratchFolder {
 public:
  ScratchFolder();
  ~ScratchFolder();
  ScratchFolder(const ScratchFolder&) = delete;
  ScratchFolder& operator=(const ScratchFolder&) = delete;

  std::string operator/(const std::string& name) const { return path_ + "/" + name; }

 private:
  std::string path_;
};

std::string TextOfFile(const std::string& path);
void WriteTextTo(const std::string& path, const std::string& text);
bool FileExists(const std::string& path);
// The permissions of the file.
unsigned ModeOf(const std::string& path);

// The program of this tree, with a pipe for each of its standard streams.
class ProgramProcess {
 public:
  explicit ProgramProcess(const std::vector<std::string>& arguments);
  // Ends the program with SIGKILL if it still runs.
  ~ProgramProcess();
  ProgramProcess(const ProgramProcess&) = delete;
  ProgramProcess& operator=(const ProgramProcess&) = delete;

  pid_t Id() const { return process_; }
  // Reads standard output until the line "ready". Throws with the error output if the program ends
  // before.
  void AwaitReady();
  // The value in the line NAME=VALUE of standard output.
  std::string Value(const std::string& name) const;
  void SendInput(const std::string& text);
  void CloseInput();
  // Reads the next line of standard output.
  std::string ReadLine();
  // Throws after the end was waited for.
  void Signal(int number) const;
  // Reads both outputs to their ends, and returns the exit status.
  int WaitForEnd();
  // The same without reading.
  int WaitForEndOnly();

  const std::string& Output() const { return output_; }
  const std::string& Errors() const { return errors_; }

 private:
  pid_t process_ = -1;
  int input_ = -1;
  int outputPipe_ = -1;
  int errorPipe_ = -1;
  std::string output_;
  std::string errors_;
  std::size_t linesRead_ = 0;  // octets of output_
};

struct ProgramResult {
  int status = -1;
  std::string output;
  std::string errors;
};

// Runs the program to its end, without input.
ProgramResult RunProgram(const std::vector<std::string>& arguments);

// The port in a URL that the program prints.
std::uint16_t PortIn(const std::string& url);

}  // namespace DevSts::Testing

#endif
