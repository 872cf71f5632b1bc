#include "process.h"

#include <csignal>

#include <gtest/gtest.h>
#include <sys/prctl.h>
#include <sys/wait.h>
#include <unistd.h>

namespace SsoClient::Tool {
namespace {

/// The status, as of waitpid, with which a child ends that runs `end` after the preparation.
template <class End>
int StatusAfter(End end) {
  const pid_t child = fork();
  if (child == 0) {
    PrepareProcess();
    end();
    _exit(99);
  }
  int status = -1;
  EXPECT_EQ(waitpid(child, &status, 0), child);
  return status;
}

TEST(ProcessTest, ItsMemoryIsForNobodyElse) {
  ASSERT_EQ(prctl(PR_GET_DUMPABLE), 1);  // of this process, which is not prepared
  const int status = StatusAfter([] { _exit(prctl(PR_GET_DUMPABLE)); });
  ASSERT_TRUE(WIFEXITED(status));
  EXPECT_EQ(WEXITSTATUS(status), 0);
}

TEST(ProcessTest, AFailedWriteIsNoSignal) {
  const int status = StatusAfter([] {
    raise(SIGPIPE);
    raise(SIGXFSZ);
    _exit(0);
  });
  EXPECT_TRUE(WIFEXITED(status));
}

}  // namespace
}  // namespace SsoClient::Tool
