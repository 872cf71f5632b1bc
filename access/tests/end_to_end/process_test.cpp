// Processes that end, or fork, while token sources are at work. The STS is in this process.
#include <chrono>
#include <string>

#include <gtest/gtest.h>

#include "end_to_end/end_to_end_fixture.h"
#include "support/child_process.h"
#include "support/temporary_file.h"

namespace SsoClient::Access::Testing {
namespace {

// The threads of the parent that call while it forks. The allocator of AddressSanitizer remains
// locked in a child when another thread allocates during the fork, so there the parent's threads
// are idle.
#ifdef __SANITIZE_ADDRESS__
constexpr int kThreads = 0;
#else
constexpr int kThreads = 16;
#endif

class ProcessTest : public testing::Test {
 protected:
  /// The probe checks how long its exit takes.
  void ExpectEnds(const std::string& scenario, int microseconds) const {
    EXPECT_EQ(Tarnik::Testing::RunToEnd({END_PROBE, scenario, sts_.HttpsUrl(), ca_.Path(),
                                         signing_.Path(), std::to_string(microseconds)}),
              0)
        << scenario << " after " << microseconds << " us";
  }

  DevSts::Server sts_;
  const Tarnik::Testing::TemporaryFile ca_{sts_.CaCertificatePem()};
  const Tarnik::Testing::TemporaryFile signing_{sts_.SigningCertificatePem()};
};

TEST_F(ProcessTest, ExitsWhileCallsAndRefreshesAreUnderWay) {
  for (const int microseconds : {0, 500, 3000, 10000, 30000, 70000, 150000, 300000}) {
    ExpectEnds("exit", microseconds);
  }
}

TEST_F(ProcessTest, ExitsWhileTheServiceIsSilent) {
  sts_.SetMisbehavior(Stalling(DevSts::Stall::BeforeAnswer));
  ExpectEnds("exit", 200000);
}

TEST_F(ProcessTest, ExitReportsToAllCallbacks) {
  for (const int microseconds : {0, 20000, 100000}) {
    ExpectEnds("reports", microseconds);
  }
  sts_.SetMisbehavior(Stalling(DevSts::Stall::BeforeAnswer));
  ExpectEnds("reports", 100000);
}

TEST_F(ProcessTest, ExitEndsACallThatADestructorWaitsFor) {
  sts_.SetMisbehavior(Stalling(DevSts::Stall::BeforeAnswer));
  for (const int microseconds : {0, 20000, 200000}) {
    ExpectEnds("join", microseconds);
  }
}

TEST_F(ProcessTest, ExitRefusesACallOfAnExitHandler) {
  ExpectEnds("call-in-handler", 0);
  ExpectEnds("call-in-handler", 50000);
}

TEST_F(ProcessTest, ExitDestroysASourceThatIsGlobal) {
  for (const int microseconds : {0, 10000, 100000}) {
    ExpectEnds("global", microseconds);
  }
  sts_.SetMisbehavior(Stalling(DevSts::Stall::BeforeAnswer));
  ExpectEnds("global", 100000);
}

TEST_F(ProcessTest, ChildrenOfAProcessWithRefreshesUnderWayCanCall) {
  DevSts::Server silent;
  silent.SetMisbehavior(Stalling(DevSts::Stall::BeforeTlsHandshake));
  EXPECT_EQ(Tarnik::Testing::RunToEnd({FORK_PROBE, sts_.HttpsUrl(), silent.HttpsUrl(), ca_.Path(),
                                       signing_.Path(), "10", std::to_string(kThreads)},
                                      {.isLeakCheckOff = true}),
            0);
}

}  // namespace
}  // namespace SsoClient::Access::Testing
