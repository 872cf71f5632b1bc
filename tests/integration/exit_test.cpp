#include <chrono>
#include <string>

#include <gtest/gtest.h>

#include "integration/sts_fixture.h"
#include "support/child_process.h"
#include "support/temporary_file.h"

namespace SsoClient::Testing {
namespace {

class ExitTest : public StsTest {
 protected:
  /// Runs the probe, which exits after some `microseconds`. It checks the time that the exit
  /// handler of the library took; the whole needs no time limit of a call.
  void ExpectEnds(const std::string& scenario, int microseconds) {
    const auto start = std::chrono::steady_clock::now();
    EXPECT_EQ(Tarnik::Testing::RunToEnd({EXIT_PROBE, scenario, Sts().HttpsUrl(), ca_.Path(),
                                         signing_.Path(), std::to_string(microseconds)}),
              0)
        << scenario << " after " << microseconds << " us";
    EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::seconds(30));
  }

  static void MakeStsSilent() {
    DevSts::Misbehavior silent;
    silent.stall = DevSts::Stall::BeforeAnswer;
    Sts().SetMisbehavior(silent);
  }

 private:
  const Tarnik::Testing::TemporaryFile ca_{Sts().CaCertificatePem()};
  const Tarnik::Testing::TemporaryFile signing_{Sts().SigningCertificatePem()};
};

TEST_F(ExitTest, ProcessMayExitWhileAsyncCallsAreUnderWay) {
  for (const int microseconds : {0, 500, 2000, 5000, 10000, 20000, 40000, 80000, 160000, 320000}) {
    ExpectEnds("async", microseconds);
  }
}

TEST_F(ExitTest, ProcessMayExitWhileTheServiceIsSilent) {
  MakeStsSilent();
  ExpectEnds("async", 300000);
}

TEST_F(ExitTest, EndsACallThatADestructorWaitsFor) {
  MakeStsSilent();
  for (const int microseconds : {0, 2000, 20000, 300000}) {
    ExpectEnds("join", microseconds);
  }
}

TEST_F(ExitTest, EndsACallThatAnExitHandlerMakes) {
  ExpectEnds("call-in-handler", 0);
}

TEST_F(ExitTest, RefusesAnAsyncCallThatAnExitHandlerMakes) {
  ExpectEnds("async-call-in-handler", 0);
}

TEST_F(ExitTest, ReportsTheEndToACallbackThatAnExitHandlerWaitsFor) {
  MakeStsSilent();
  ExpectEnds("callback-in-handler", 100000);
}

TEST_F(ExitTest, ReportsTheEndToCallbacksOfCallsThatWaitForAWorker) {
  MakeStsSilent();
  ExpectEnds("queued-callbacks-in-handler", 300000);
}

}  // namespace
}  // namespace SsoClient::Testing
