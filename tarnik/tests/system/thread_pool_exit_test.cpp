#include <algorithm>
#include <chrono>
#include <string>
#include <thread>

#include <gtest/gtest.h>
#include <signal.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

extern char** environ;

namespace Tarnik::Testing {
namespace {

constexpr std::chrono::seconds kExitLimit{30};
// ThreadSanitizer sleeps for a second at each exit.
#ifdef __SANITIZE_THREAD__
constexpr int kRepetitions = 3;
#else
constexpr int kRepetitions = 20;
#endif
constexpr int kHung = -1;
constexpr int kNotStarted = -2;

// The exit status of the probe, or 128 plus the number of the signal that has ended it.
int RunProbe(const std::string& scenario) {
  std::string program = TARNIK_EXIT_PROBE;
  std::string argument = scenario;
  char* const arguments[] = {program.data(), argument.data(), nullptr};
  pid_t child = 0;
  if (posix_spawn(&child, program.c_str(), nullptr, nullptr, arguments, environ) != 0) {
    return kNotStarted;
  }
  const auto limit = std::chrono::steady_clock::now() + kExitLimit;
  int status = 0;
  while (waitpid(child, &status, WNOHANG) == 0) {
    if (std::chrono::steady_clock::now() > limit) {
      kill(child, SIGKILL);
      waitpid(child, &status, 0);
      return kHung;
    }
    std::this_thread::sleep_for(std::chrono::milliseconds(5));
  }
  return WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
}

class ThreadPoolExitTest : public testing::TestWithParam<const char*> {};

TEST_P(ThreadPoolExitTest, NeitherCrashesNorHangs) {
  for (int i = 0; i < kRepetitions; ++i) {
    ASSERT_EQ(RunProbe(GetParam()), 0) << "run " << i;
  }
}

std::string NameOf(const testing::TestParamInfo<const char*>& info) {
  std::string name = info.param;
  std::replace(name.begin(), name.end(), '-', '_');
  return name;
}

INSTANTIATE_TEST_SUITE_P(Scenarios, ThreadPoolExitTest,
                         testing::Values("busy", "blocked", "openssl", "timers", "completions",
                                         "connects", "exit-from-worker", "exit-from-io", "unused"),
                         NameOf);

TEST(ThreadPoolExitProbeTest, ReportsAnUnknownScenario) {
  EXPECT_EQ(RunProbe("no such scenario"), 2);
}

}  // namespace
}  // namespace Tarnik::Testing
