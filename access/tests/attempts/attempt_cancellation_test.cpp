// Attempts that are cancelled, or whose time is over, at every stage.
#include <chrono>
#include <functional>
#include <ostream>
#include <string>
#include <thread>

#include <gmock/gmock.h>

#include "attempts/endpoint_fixture.h"

namespace SsoClient::Access {
namespace {

using namespace std::chrono_literals;
using SsoClient::Testing::TenMinutes;
using Tarnik::Http::ExchangeStage;
using Clock = std::chrono::steady_clock;

constexpr std::size_t kMoreThanSocketsBuffer = std::size_t{16} << 20;

struct Stage {
  const char* name;
  DevSts::Stall stall;
  bool isTls;
  bool isLarge;
  const char* awaited;
  Tarnik::Http::ExchangeStage stage;
};

std::ostream& operator<<(std::ostream& stream, const Stage& stage) {
  return stream << stage.name;
}

class AttemptStageAsyncTest : public testing::TestWithParam<Stage> {
 protected:
  AttemptStageAsyncTest() {
    DevSts::Misbehavior silent;
    silent.stall = GetParam().stall;
    server_.SetMisbehavior(silent);
    if (GetParam().isLarge) {
      spec_.advice.push_back({"test", {{"text", {std::string(kMoreThanSocketsBuffer, 'x')}}}});
    }
  }

  AttemptOutcome Attempt(Tarnik::Http::CallLimit& limit) {
    const std::string password = kPassword;
    const auto client = CreateEndpointClient(
        ConfigFor(server_), {GetParam().isTls ? server_.HttpsUrl() : server_.HttpUrl(), ""});
    return client->Attempt({AttemptOperation::kLogin, spec_, nullptr, password}, limit);
  }

  DevSts::Server server_;
  TokenSpec spec_ = TenMinutes();
};

TEST_P(AttemptStageAsyncTest, CancellingEndsTheAttempt) {
  const auto limit = AMinute();
  Clock::time_point cancelled;
  std::thread canceller([&] {
    EXPECT_TRUE(server_.WaitUntil([](const DevSts::Counters& seen) { return seen.stalled == 1; }));
    // The service may be further than the client.
    while (limit->Stage() != GetParam().stage) {
      std::this_thread::yield();
    }
    cancelled = Clock::now();
    limit->Cancel();
  });
  EXPECT_EQ(limit->Stage(), ExchangeStage::kNone);
  const AttemptOutcome outcome = Attempt(*limit);
  const Clock::time_point ended = Clock::now();
  canceller.join();
  EXPECT_EQ(limit->Stage(), ExchangeStage::kNone);
  ExpectFailure<CommunicationException>(outcome, FailureKind::kAbandoned);
  // Far from the minute that the attempt could take, also on a loaded machine.
  EXPECT_LT(ended - cancelled, 5s);
}

TEST_P(AttemptStageAsyncTest, TheEndOfItsTimeEndsTheAttempt) {
  const Clock::time_point deadline = Clock::now() + 400ms;
  const AttemptOutcome outcome = Attempt(*Tarnik::Http::CreateCallLimit(deadline));
  EXPECT_GE(Clock::now(), deadline);
  // On a loaded machine, the time may pass earlier.
  const char* earlier = GetParam().isTls ? "the TLS handshake." : "the connection.";
  EXPECT_THAT(ExpectFailure<CommunicationException>(outcome, FailureKind::kTimedOut),
              testing::AnyOf(testing::EndsWith(std::string("waiting for ") + GetParam().awaited),
                             testing::EndsWith(std::string("waiting for ") + earlier),
                             testing::Eq("The time of the attempt is over.")));
}

INSTANTIATE_TEST_SUITE_P(
    Stages, AttemptStageAsyncTest,
    testing::Values(Stage{"Handshake", DevSts::Stall::BeforeTlsHandshake, true, false,
                          "the TLS handshake.", ExchangeStage::kHandshake},
                    Stage{"Writing", DevSts::Stall::BeforeRequest, false, true,
                          "the request to be sent.", ExchangeStage::kSending},
                    Stage{"WritingTls", DevSts::Stall::BeforeRequest, true, true,
                          "the request to be sent.", ExchangeStage::kSending},
                    Stage{"Answer", DevSts::Stall::BeforeAnswer, false, false, "the answer.",
                          ExchangeStage::kAnswer},
                    Stage{"Headers", DevSts::Stall::AfterHeaders, false, false, "the answer.",
                          ExchangeStage::kRestOfAnswer},
                    Stage{"Body", DevSts::Stall::InMidBody, false, false, "the answer.",
                          ExchangeStage::kRestOfAnswer}),
    [](const auto& tested) { return tested.param.name; });

TEST(AttemptDripTest, BytesThatArriveSlowlyDoNotExtendAnAttempt) {
  DevSts::Server server;
  DevSts::Misbehavior slow;
  slow.drip = DevSts::Drip{1, 5ms};
  server.SetMisbehavior(slow);
  const TokenSpec spec = TenMinutes();
  const std::string password = kPassword;
  const auto limit = Tarnik::Http::CreateCallLimit(Clock::now() + 200ms);
  const auto client = CreateEndpointClient(ConfigFor(server), {server.HttpUrl(), ""});
  ExpectFailure<CommunicationException>(
      client->Attempt({AttemptOperation::kLogin, spec, nullptr, password}, *limit),
      FailureKind::kTimedOut);
}

}  // namespace
}  // namespace SsoClient::Access
