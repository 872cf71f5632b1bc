#include <algorithm>
#include <chrono>
#include <string>

#include <gtest/gtest.h>

#include "support/child_process.h"

namespace Tarnik::Testing {
namespace {

constexpr std::chrono::seconds kExitLimit{30};
// ThreadSanitizer sleeps for a second at each exit.
#ifdef __SANITIZE_THREAD__
constexpr int kRepetitions = 3;
#else
constexpr int kRepetitions = 20;
#endif

int RunProbe(const std::string& scenario) {
  return RunToEnd({TARNIK_EXIT_PROBE, scenario}, {.limit = kExitLimit});
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
