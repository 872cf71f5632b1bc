// Calls that their caller limits.
#include <chrono>
#include <cstddef>
#include <future>
#include <memory>
#include <string>
#include <thread>
#include <typeinfo>
#include <utility>
#include <vector>

#include <gmock/gmock.h>

#include <tarnik/http/bounded_user_agent.h>
#include <tarnik/http/connection_specs.h>
#include <tarnik/http/http_user_agent.h>
#include <tarnik/system/thread_pool.h>

#include "integration/sts_fixture.h"
#include "support/async_call.h"

namespace SsoClient::Testing {
namespace {

using namespace std::chrono_literals;
using Tarnik::Http::CallLimit;
using Clock = CallLimit::Clock;

class BoundedCallAsyncTest : public StsTest {
 protected:
  static Tarnik::Ref<Tarnik::Http::UserAgent> Agent() {
    static const auto trust = TrustCa(Sts());
    const auto spec =
        Tarnik::Http::CreateTLSConnectionSpec("127.0.0.1", Sts().HttpsPort(), trust.get(), "");
    return Tarnik::Http::CreateHttpUserAgent(spec.get(), nullptr, nullptr);
  }

  static std::shared_ptr<SecurityTokenService> ServiceWithin(
      CallLimit& limit, const Tarnik::Ref<Tarnik::Http::UserAgent>& agent = Agent()) {
    SecurityTokenServiceConfigEx config;
    config.url = "/sts";
    config.userAgent = Tarnik::Http::CreateBoundedUserAgent(agent.get(), &limit);
    config.tokenFactory = CreateSamlTokenFactory(TrustSigner(Sts().SigningCertificatePem()).get());
    return CreateSecurityTokenService(config);
  }

  static void StallAt(DevSts::Stall stall, DevSts::Server& server = Sts()) {
    DevSts::Misbehavior silent;
    silent.stall = stall;
    server.SetMisbehavior(silent);
  }
};

TEST_F(BoundedCallAsyncTest, ACallWithinItsLimitSucceeds) {
  const auto limit = Tarnik::Http::CreateCallLimit(Clock::now() + 60s);
  EXPECT_EQ(ServiceWithin(*limit)->AcquireToken(kUser, kPassword, TenMinutes())->Subject().name,
            "alice");
}

TEST_F(BoundedCallAsyncTest, ACallEndsAtItsDeadlineAndSaysWhatItWaitedFor) {
  const std::string endpoint = "127.0.0.1:" + std::to_string(Sts().HttpsPort());
  for (const auto& [stall, awaited] :
       {std::pair{DevSts::Stall::BeforeTlsHandshake, "the TLS handshake"},
        std::pair{DevSts::Stall::BeforeAnswer, "the [a-z ]+"}}) {
    StallAt(stall);
    const auto deadline = Clock::now() + 300ms;
    const auto limit = Tarnik::Http::CreateCallLimit(deadline);
    const auto service = ServiceWithin(*limit);
    const std::string pattern = "The caller's deadline has passed. No answer from " + endpoint +
                                " within [0-9]+ milliseconds: waiting for " + awaited + "\\.";
    EXPECT_THAT(MessageOf<CommunicationException>(
                    [&] { service->AcquireToken(kUser, kPassword, TenMinutes()); }),
                testing::MatchesRegex(pattern));
    EXPECT_GE(Clock::now(), deadline);
    EXPECT_EQ(MessageOf<CommunicationException>(
                  [&] { service->AcquireToken(kUser, kPassword, TenMinutes()); }),
              "The caller's deadline has passed.");
  }
}

TEST_F(BoundedCallAsyncTest, ACallEndsWhenAnotherThreadCancelsIt) {
  StallAt(DevSts::Stall::BeforeAnswer);
  const auto limit = Tarnik::Http::CreateCallLimit(Clock::time_point::max());
  const auto service = ServiceWithin(*limit);
  AsyncCall call;
  service->AcquireTokenAsync(kUser, kPassword, TenMinutes(), call.Callback());
  std::thread canceller([limit] { limit->Cancel(); });
  const Report report = call.Wait();
  canceller.join();
  EXPECT_EQ(report.errorType, typeid(CommunicationException).name());
  EXPECT_THAT(report.message, testing::HasSubstr(" was cancelled"));
}

// More calls than the pool has workers, each given up by its caller, hold no other call.
TEST_F(BoundedCallAsyncTest, AbandonedCallsToASilentServiceDoNotHoldAHealthyOne) {
  constexpr std::size_t kCalls = Tarnik::System::ThreadPool::kMaxWorkers + 20;
  DevSts::Server silentSts;
  StallAt(DevSts::Stall::BeforeRequest, silentSts);
  const auto spec = Tarnik::Http::CreateTCPConnectionSpec("127.0.0.1", silentSts.HttpPort());
  const auto agent = Tarnik::Http::CreateHttpUserAgent(spec.get(), nullptr, nullptr);
  const auto limit = Tarnik::Http::CreateCallLimit(Clock::now() + 500ms);
  const auto silent = ServiceWithin(*limit, agent);
  std::vector<AsyncCall> abandoned(kCalls);
  for (AsyncCall& call : abandoned) {
    silent->AcquireTokenAsync(kUser, kPassword, TenMinutes(), call.Callback());
  }
  const auto answered = std::make_shared<std::promise<bool>>();
  Service()->AcquireTokenAsync(kUser, kPassword, TenMinutes(),
                               [answered](const auto& token, const Tarnik::Exception*) {
                                 answered->set_value(token != nullptr);
                               });
  auto healthy = answered->get_future();
  ASSERT_EQ(healthy.wait_for(60s), std::future_status::ready);
  EXPECT_TRUE(healthy.get());
  for (AsyncCall& call : abandoned) {
    call.Wait();
  }
}

}  // namespace
}  // namespace SsoClient::Testing
