#include <string>

#include <gtest/gtest.h>

#include "integration/holder_of_key_fixture.h"
#include "support/child_process.h"
#include "support/temporary_file.h"

namespace SsoClient::Testing {
namespace {

using Tarnik::Testing::TemporaryFile;

// The threads of the parent that are inside calls. The allocator of AddressSanitizer remains locked
// in a child when another thread allocates during the fork, so there the parent's threads are idle.
#ifdef __SANITIZE_ADDRESS__
constexpr int kThreads = 0;
#else
constexpr int kThreads = 32;
#endif

// The STS is in this process and the calls are in the probe's, so that only the libraries of the
// probe are forked.
class ForkTest : public HolderOfKeyTest {
 protected:
  static int RunProbe(const std::string& scenario, int forks) {
    const TemporaryFile ca(Sts().CaCertificatePem());
    const TemporaryFile signing(Sts().SigningCertificatePem());
    const TemporaryFile holder(Holder().certificatePem + Holder().privateKeyPem);
    return Tarnik::Testing::RunToEnd(
        {FORK_PROBE, scenario, Sts().HttpsUrl(), ca.Path(), signing.Path(), holder.Path(),
         std::to_string(forks), std::to_string(kThreads)},
        {.isLeakCheckOff = true});
  }
};

TEST_F(ForkTest, ChildOfAProcessWithCallsUnderWayCanCall) {
  EXPECT_EQ(RunProbe("call", 25), 0);
}

TEST_F(ForkTest, ChildOfAProcessThatIsSigningCanAcquireByCertificateAndRenew) {
  EXPECT_EQ(RunProbe("sign", 10), 0);
}

TEST_F(ForkTest, ChildOfAProcessWithCallsUnderWayCanExit) {
  EXPECT_EQ(RunProbe("exit", 25), 0);
}

TEST_F(ForkTest, ChildCanExitAfterCalls) {
  EXPECT_EQ(RunProbe("call-and-exit", 10), 0);
}

TEST_F(ForkTest, ChildOfAChildCanCall) {
  EXPECT_EQ(RunProbe("grandchildren", 5), 0);
}

TEST_F(ForkTest, ChildThatReturnsFromACallbackEnds) {
  EXPECT_EQ(RunProbe("callback", 5), 0);
}

}  // namespace
}  // namespace SsoClient::Testing
