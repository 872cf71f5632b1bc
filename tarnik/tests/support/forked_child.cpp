#include "support/forked_child.h"

#include <cstdlib>

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

void EndChild(bool hasSucceeded) {
  _exit(hasSucceeded ? EXIT_SUCCESS : EXIT_FAILURE);
}

}  // namespace Tarnik::Testing
