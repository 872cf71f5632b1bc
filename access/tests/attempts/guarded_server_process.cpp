#include "guarded_server_process.h"

#include <array>
#include <cerrno>
#include <chrono>
#include <cstddef>
#include <cstdio>
#include <stdexcept>
#include <system_error>
#include <utility>

#include <fcntl.h>
#include <gtest/gtest.h>
#include <signal.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

extern char** environ;

namespace SsoClient::Access::Testing {
namespace {

constexpr std::chrono::seconds kPatience{30};
constexpr char kPortLine[] = "port=";

std::array<int, 2> MakePipe() {
  std::array<int, 2> ends{};
  if (pipe2(ends.data(), O_CLOEXEC) != 0) {
    throw std::system_error(errno, std::generic_category(), "pipe2");
  }
  return ends;
}

/// With both output streams sent to `output`.
pid_t Start(std::vector<std::string> command, int output) {
  std::vector<char*> words;
  for (std::string& word : command) {
    words.push_back(word.data());
  }
  words.push_back(nullptr);
  posix_spawn_file_actions_t actions;
  posix_spawn_file_actions_init(&actions);
  posix_spawn_file_actions_adddup2(&actions, output, STDOUT_FILENO);
  posix_spawn_file_actions_adddup2(&actions, output, STDERR_FILENO);
  pid_t process = -1;
  const int error = posix_spawn(&process, words[0], &actions, nullptr, words.data(), environ);
  posix_spawn_file_actions_destroy(&actions);
  if (error != 0) {
    throw std::system_error(error, std::generic_category(), command[0]);
  }
  return process;
}

}  // namespace

GuardedServerProcess::GuardedServerProcess(std::vector<std::string> arguments) {
  arguments.insert(arguments.begin(), EXAMPLES_FOLDER "/guarded_server/guarded_server");
  const auto [log, output] = MakePipe();
  process_ = Start(std::move(arguments), output);
  close(output);
  reader_ = std::thread([this, descriptor = log] { ReadLog(descriptor); });
  const std::string begin = AwaitInLog(kPortLine);
  const std::size_t at = begin.find(kPortLine);
  if (at == std::string::npos) {
    throw std::runtime_error("the server did not start: " + begin);
  }
  port_ = std::stoi(begin.substr(at + sizeof kPortLine - 1));
}

GuardedServerProcess::~GuardedServerProcess() {
  if (process_ > 0) {
    kill(process_, SIGKILL);
    WaitForEnd();
  }
}

void GuardedServerProcess::Signal(int signal) const {
  kill(process_, signal);
}

std::string GuardedServerProcess::AwaitInLog(const std::string& text) {
  std::unique_lock lock(mutex_);
  const auto isThere = [&] {
    const std::size_t at = log_.find(text);
    return at != std::string::npos && log_.find('\n', at) != std::string::npos;
  };
  logged_.wait_for(lock, kPatience, [&] { return isThere() || hasEnded_; });
  EXPECT_TRUE(isThere()) << "not in the log: " << text << "\n" << log_;
  return log_;
}

int GuardedServerProcess::WaitForEnd() {
  {
    std::unique_lock lock(mutex_);
    if (!logged_.wait_for(lock, kPatience, [this] { return hasEnded_; })) {
      kill(process_, SIGKILL);
    }
  }
  int status = 0;
  waitpid(process_, &status, 0);
  process_ = -1;
  reader_.join();
  return WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
}

void GuardedServerProcess::ReadLog(int descriptor) {
  std::array<char, 4096> buffer;
  for (ssize_t count = 0; (count = read(descriptor, buffer.data(), buffer.size())) > 0;) {
    const std::lock_guard lock(mutex_);
    log_.append(buffer.data(), static_cast<std::size_t>(count));
    logged_.notify_all();
  }
  close(descriptor);
  const std::lock_guard lock(mutex_);
  hasEnded_ = true;
  logged_.notify_all();
}

}  // namespace SsoClient::Access::Testing
