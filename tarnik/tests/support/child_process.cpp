#include "support/child_process.h"

#include <array>
#include <cerrno>
#include <cstddef>
#include <cstdio>
#include <cstdlib>
#include <stdexcept>
#include <utility>

#include <poll.h>
#include <signal.h>
#include <spawn.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>

extern char** environ;

namespace Tarnik::Testing {
namespace {

std::vector<char*> Pointers(std::vector<std::string>& texts) {
  std::vector<char*> pointers;
  for (auto& text : texts) {
    pointers.push_back(text.data());
  }
  pointers.push_back(nullptr);
  return pointers;
}

std::vector<std::string> Environment(bool isLeakCheckOff) {
  std::vector<std::string> variables;
  if (isLeakCheckOff) {
    // The first of several variables of a name counts.
    const char* const options = std::getenv("ASAN_OPTIONS");
    variables.push_back("ASAN_OPTIONS=" + std::string(options == nullptr ? "" : options) +
                        ":detect_leaks=0");
  }
  for (char** variable = environ; *variable != nullptr; ++variable) {
    variables.emplace_back(*variable);
  }
  return variables;
}

pid_t Start(std::vector<std::string> command, bool isLeakCheckOff) {
  std::vector<std::string> environment = Environment(isLeakCheckOff);
  pid_t child = -1;
  if (posix_spawn(&child, command[0].c_str(), nullptr, nullptr, Pointers(command).data(),
                  Pointers(environment).data()) != 0) {
    throw std::runtime_error("cannot run " + command[0]);
  }
  return child;
}

bool EndsWithin(pid_t child, std::chrono::milliseconds limit) {
  // The C library declares this function, but not for C++.
  pollfd ended{static_cast<int>(syscall(SYS_pidfd_open, child, 0)), POLLIN, 0};
  if (ended.fd < 0) {
    throw std::runtime_error("cannot wait for a program");
  }
  int count = 0;
  do {
    count = poll(&ended, 1, static_cast<int>(limit.count()));
  } while (count < 0 && errno == EINTR);
  close(ended.fd);
  return count > 0;
}

int StatusOf(int waitStatus) {
  return WIFEXITED(waitStatus) ? WEXITSTATUS(waitStatus) : 128 + WTERMSIG(waitStatus);
}

}  // namespace

int RunToEnd(std::vector<std::string> command, const RunOptions& options) {
  const pid_t child = Start(std::move(command), options.isLeakCheckOff);
  if (!EndsWithin(child, options.limit)) {
    kill(child, SIGKILL);
  }
  int status = 0;
  if (waitpid(child, &status, 0) != child) {
    throw std::runtime_error("cannot wait for a program");
  }
  return StatusOf(status);
}

CommandResult RunInShell(const std::string& line) {
  std::FILE* const pipe = popen(line.c_str(), "re");
  if (pipe == nullptr) {
    throw std::runtime_error("cannot run the shell");
  }
  CommandResult result;
  std::array<char, 4096> buffer;
  while (const std::size_t count = std::fread(buffer.data(), 1, buffer.size(), pipe)) {
    result.output.append(buffer.data(), count);
  }
  result.status = StatusOf(pclose(pipe));
  return result;
}

}  // namespace Tarnik::Testing
