#include "support/forked_child.h"

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <string>

#include <sys/wait.h>
#include <unistd.h>

namespace Tarnik::Testing {

bool HasSucceeded(pid_t child) {
  int status = -1;
  return child > 0 && waitpid(child, &status, 0) == child && status == 0;
}

pid_t ForkWithLimit() {
  const pid_t child = fork();
  if (child == 0) {
    alarm(60);
  }
  return child;
}

namespace {

bool AreOtherThreadsAsleep() {
  const std::string own = std::to_string(gettid());
  for (const auto& thread : std::filesystem::directory_iterator("/proc/self/task")) {
    if (thread.path().filename() == own) {
      continue;
    }
    std::string stat;
    std::getline(std::ifstream(thread.path() / "stat"), stat);
    // The state follows the name, which is in parentheses (proc(5)).
    const auto name = stat.rfind(") ");
    if (name != std::string::npos && stat[name + 2] != 'S') {
      return false;
    }
  }
  return true;
}

}  // namespace

void AwaitIdleThreads() {
  // A thread may sleep between two steps, for example while it waits for the answer of another.
  constexpr int kTimesInSuccession = 20;
  for (int times = 0; times < kTimesInSuccession;) {
    times = AreOtherThreadsAsleep() ? times + 1 : 0;
  }
}

void EndChild(bool hasSucceeded) {
  _exit(hasSucceeded ? EXIT_SUCCESS : EXIT_FAILURE);
}

}  // namespace Tarnik::Testing
