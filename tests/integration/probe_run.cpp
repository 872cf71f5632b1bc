#include "integration/probe_run.h"

#include <cstdio>
#include <cstdlib>
#include <fstream>

#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

namespace SsoClient::Testing {
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
  for (char** variable = environ; *variable != nullptr; ++variable) {
    variables.emplace_back(*variable);
  }
  if (isLeakCheckOff) {
    const char* const options = std::getenv("ASAN_OPTIONS");
    variables.insert(
        variables.begin(),
        "ASAN_OPTIONS=" + std::string(options == nullptr ? "" : options) + ":detect_leaks=0");
  }
  return variables;
}

}  // namespace

TemporaryFile::TemporaryFile(const std::string& content) {
  char name[] = "/tmp/ssoclient-test-XXXXXX";
  close(mkstemp(name));
  path_ = name;
  std::ofstream(path_) << content;
}

TemporaryFile::~TemporaryFile() {
  std::remove(path_.c_str());
}

int RunToEnd(std::vector<std::string> command, bool isLeakCheckOff) {
  std::vector<std::string> environment = Environment(isLeakCheckOff);
  pid_t child = 0;
  if (posix_spawn(&child, command[0].c_str(), nullptr, nullptr, Pointers(command).data(),
                  Pointers(environment).data()) != 0) {
    return -1;
  }
  int status = -1;
  waitpid(child, &status, 0);
  return WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
}

}  // namespace SsoClient::Testing
