#include "kerberos/child_process.h"

#include <cerrno>
#include <chrono>
#include <cstdio>
#include <cstring>
#include <fstream>
#include <iterator>
#include <memory>
#include <stdexcept>
#include <thread>

#include <fcntl.h>
#include <signal.h>
#include <sys/prctl.h>
#include <sys/wait.h>
#include <unistd.h>

namespace DevSts {

namespace {

// How long a process may take to end after SIGTERM.
constexpr auto kPatience = std::chrono::seconds(5);
// The exit status of a process whose program cannot be executed.
constexpr int kNotExecuted = 127;

[[noreturn]] void ThrowSystemError(const std::string& attempt) {
  throw std::runtime_error(attempt + ": " + std::strerror(errno));
}

// Pointers to the texts, followed by a null pointer, as exec requires.
std::vector<char*> PointersTo(const std::vector<std::string>& texts) {
  std::vector<char*> pointers;
  pointers.reserve(texts.size() + 1);
  for (const auto& text : texts) {
    pointers.push_back(const_cast<char*>(text.c_str()));
  }
  pointers.push_back(nullptr);
  return pointers;
}

std::vector<std::string> EnvironmentWith(const std::vector<std::string>& variables) {
  // The first definition of a variable is the one that is used.
  std::vector<std::string> result = variables;
  for (char** next = environ; *next != nullptr; ++next) {
    result.emplace_back(*next);
  }
  return result;
}

int FileWith(const std::string& input) {
  const std::unique_ptr<std::FILE, int (*)(std::FILE*)> file(std::tmpfile(), std::fclose);
  if (file == nullptr || std::fwrite(input.data(), 1, input.size(), file.get()) != input.size() ||
      std::fflush(file.get()) != 0) {
    ThrowSystemError("A file for a program's input cannot be written");
  }
  std::rewind(file.get());
  const int copy = ::fcntl(::fileno(file.get()), F_DUPFD_CLOEXEC, 3);
  if (copy < 0) {
    ThrowSystemError("A file for a program's input cannot be opened");
  }
  return copy;
}

pid_t Start(const Command& command) {
  const auto environment = EnvironmentWith(command.variables);
  const auto arguments = PointersTo(command.arguments);
  const auto variables = PointersTo(environment);
  const int input = FileWith(command.input);
  const int output =
      ::open(command.outputPath.c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC, 0600);
  if (output < 0) {
    ::close(input);
    ThrowSystemError("The file '" + command.outputPath + "' cannot be opened");
  }
  // Between fork and exec, only calls that are safe in the copy of a multi-threaded process.
  const pid_t process = ::fork();
  if (process == 0) {
    // Ends the process if the test crashes.
    ::prctl(PR_SET_PDEATHSIG, SIGKILL);
    // Signals that the caller blocks must still end the program.
    sigset_t none;
    ::sigemptyset(&none);
    ::sigprocmask(SIG_SETMASK, &none, nullptr);
    ::dup2(input, STDIN_FILENO);
    ::dup2(output, STDOUT_FILENO);
    ::dup2(output, STDERR_FILENO);
    ::execvpe(arguments[0], arguments.data(), variables.data());
    ::_exit(kNotExecuted);
  }
  ::close(input);
  ::close(output);
  if (process < 0) {
    ThrowSystemError("A process cannot be started");
  }
  return process;
}

int WaitForEnd(pid_t process) {
  int status = 0;
  while (::waitpid(process, &status, 0) < 0 && errno == EINTR) {
  }
  return status;
}

std::string TextOf(const std::string& path) {
  std::ifstream file(path);
  return {std::istreambuf_iterator<char>(file), {}};
}

}  // namespace

void RunToEnd(const Command& command) {
  const int status = WaitForEnd(Start(command));
  if (WIFEXITED(status) && WEXITSTATUS(status) == kNotExecuted) {
    throw std::runtime_error(
        "'" + command.arguments[0] +
        "' is not installed; a realm needs the packages krb5-kdc, krb5-admin-server and krb5-user");
  }
  if (!WIFEXITED(status) || WEXITSTATUS(status) != 0) {
    throw std::runtime_error("'" + command.arguments[0] +
                             "' failed: " + TextOf(command.outputPath));
  }
}

BackgroundProcess::BackgroundProcess(const Command& command) : process_(Start(command)) {}

BackgroundProcess::~BackgroundProcess() {
  if (hasEnded_) {
    return;
  }
  ::kill(process_, SIGTERM);
  const auto limit = std::chrono::steady_clock::now() + kPatience;
  while (IsRunning() && std::chrono::steady_clock::now() < limit) {
    std::this_thread::sleep_for(std::chrono::milliseconds(1));
  }
  if (!hasEnded_) {
    ::kill(process_, SIGKILL);
    WaitForEnd(process_);
  }
}

bool BackgroundProcess::IsRunning() {
  hasEnded_ = hasEnded_ || ::waitpid(process_, nullptr, WNOHANG) != 0;
  return !hasEnded_;
}

}  // namespace DevSts
