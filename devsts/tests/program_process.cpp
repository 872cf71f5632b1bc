#include "program_process.h"

#include <array>
#include <cerrno>
#include <csignal>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <stdexcept>

#include <fcntl.h>
#include <poll.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

namespace DevSts::Testing {
namespace {

std::string NewFolder() {
  std::string pattern = std::filesystem::temp_directory_path() / "devsts-test-XXXXXX";
  if (::mkdtemp(pattern.data()) == nullptr) {
    throw std::runtime_error("A temporary folder cannot be created");
  }
  return pattern;
}

std::array<int, 2> NewPipe() {
  std::array<int, 2> ends{};
  if (::pipe2(ends.data(), O_CLOEXEC) != 0) {
    throw std::runtime_error("A pipe cannot be created");
  }
  return ends;
}

void CloseOnce(int& descriptor) {
  if (descriptor >= 0) {
    ::close(descriptor);
    descriptor = -1;
  }
}

// Appends what arrives next. Returns false at the end.
bool ReadMore(int descriptor, std::string& text) {
  std::array<char, 4096> block{};
  ssize_t size = 0;
  do {
    size = ::read(descriptor, block.data(), block.size());
  } while (size < 0 && errno == EINTR);
  if (size > 0) {
    text.append(block.data(), static_cast<std::size_t>(size));
  }
  return size > 0;
}

[[noreturn]] void Execute(std::vector<char*>& arguments, int input, int output, int errors) {
  sigset_t none;
  ::sigemptyset(&none);
  ::sigprocmask(SIG_SETMASK, &none, nullptr);
  ::dup2(input, STDIN_FILENO);
  ::dup2(output, STDOUT_FILENO);
  ::dup2(errors, STDERR_FILENO);
  ::execv(arguments[0], arguments.data());
  ::_exit(127);
}

}  // namespace

ScratchFolder::ScratchFolder() : path_(NewFolder()) {}

ScratchFolder::~ScratchFolder() {
  std::error_code ignored;
  std::filesystem::remove_all(path_, ignored);
}

std::string TextOfFile(const std::string& path) {
  std::ifstream file(path, std::ios::binary);
  return {std::istreambuf_iterator<char>(file), {}};
}

void WriteTextTo(const std::string& path, const std::string& text) {
  std::ofstream file(path, std::ios::binary | std::ios::trunc);
  if (!(file << text).flush()) {
    throw std::runtime_error("The file cannot be written: " + path);
  }
}

bool FileExists(const std::string& path) {
  return std::filesystem::exists(path);
}

unsigned ModeOf(const std::string& path) {
  struct stat found {};
  return ::stat(path.c_str(), &found) == 0 ? found.st_mode & 07777U : 0;
}

ProgramProcess::ProgramProcess(const std::vector<std::string>& arguments) {
  std::vector<std::string> texts{DEVSTS_PROGRAM};
  texts.insert(texts.end(), arguments.begin(), arguments.end());
  std::vector<char*> pointers;
  pointers.reserve(texts.size() + 1);
  for (std::string& text : texts) {
    pointers.push_back(text.data());
  }
  pointers.push_back(nullptr);
  const auto input = NewPipe();
  const auto output = NewPipe();
  const auto errors = NewPipe();
  process_ = ::fork();
  if (process_ == 0) {
    Execute(pointers, input[0], output[1], errors[1]);
  }
  ::close(input[0]);
  ::close(output[1]);
  ::close(errors[1]);
  input_ = input[1];
  outputPipe_ = output[0];
  errorPipe_ = errors[0];
  if (process_ < 0) {
    throw std::runtime_error("A process cannot be started");
  }
}

ProgramProcess::~ProgramProcess() {
  CloseOnce(input_);
  CloseOnce(outputPipe_);
  CloseOnce(errorPipe_);
  if (process_ > 0) {
    ::kill(process_, SIGKILL);
    ::waitpid(process_, nullptr, 0);
  }
}

void ProgramProcess::AwaitReady() {
  while (ReadLine() != "ready") {
  }
}

std::string ProgramProcess::Value(const std::string& name) const {
  const std::string text = "\n" + output_;
  const std::size_t at = text.find("\n" + name + "=");
  if (at == std::string::npos) {
    throw std::runtime_error("The program did not print " + name);
  }
  const std::size_t begin = at + name.size() + 2;
  return text.substr(begin, text.find('\n', begin) - begin);
}

void ProgramProcess::SendInput(const std::string& text) {
  if (::write(input_, text.data(), text.size()) != static_cast<ssize_t>(text.size())) {
    throw std::runtime_error("The program does not read its input");
  }
}

void ProgramProcess::CloseInput() {
  CloseOnce(input_);
}

std::string ProgramProcess::ReadLine() {
  std::size_t end = output_.find('\n', linesRead_);
  for (; end == std::string::npos; end = output_.find('\n', linesRead_)) {
    if (!ReadMore(outputPipe_, output_)) {
      const int status = WaitForEnd();
      throw std::runtime_error("The program ended with status " + std::to_string(status) + ": " +
                               errors_);
    }
  }
  const std::string line = output_.substr(linesRead_, end - linesRead_);
  linesRead_ = end + 1;
  return line;
}

void ProgramProcess::Signal(int number) const {
  if (process_ <= 0) {
    throw std::logic_error("The program has ended");  // kill(-1) would signal every process
  }
  ::kill(process_, number);
}

int ProgramProcess::WaitForEnd() {
  while (ReadMore(outputPipe_, output_)) {
  }
  while (ReadMore(errorPipe_, errors_)) {
  }
  return WaitForEndOnly();
}

int ProgramProcess::WaitForEndOnly() {
  int status = 0;
  while (::waitpid(process_, &status, 0) < 0 && errno == EINTR) {
  }
  process_ = -1;
  return WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
}

ProgramResult RunProgram(const std::vector<std::string>& arguments) {
  ProgramProcess program(arguments);
  program.CloseInput();
  ProgramResult result;
  result.status = program.WaitForEnd();
  result.output = program.Output();
  result.errors = program.Errors();
  return result;
}

std::uint16_t PortIn(const std::string& url) {
  const std::size_t colon = url.rfind(':');
  return static_cast<std::uint16_t>(std::stoul(url.substr(colon + 1)));
}

}  // namespace DevSts::Testing
