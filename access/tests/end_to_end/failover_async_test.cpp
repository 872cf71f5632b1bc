// Endpoints that fail, and others that are asked instead.
#include <chrono>
#include <functional>
#include <memory>
#include <ostream>
#include <string>
#include <utility>
#include <vector>

#include <gmock/gmock.h>

#include "end_to_end/end_to_end_fixture.h"
#include "support/dead_listener.h"
#include "support/loopback.h"

namespace SsoClient::Access::Testing {
namespace {

using namespace std::chrono_literals;
using testing::HasSubstr;

DevSts::ServerOptions With(DevSts::ServerCertificate certificate) {
  DevSts::ServerOptions options;
  options.tls.certificate = certificate;
  return options;
}

/// An endpoint that fails, and what is needed for that.
class BrokenEndpoint {
 public:
  explicit BrokenEndpoint(const DevSts::Misbehavior& misbehavior = {},
                          DevSts::ServerCertificate certificate = DevSts::ServerCertificate::Valid)
      : sts_(With(certificate)) {
    sts_.SetMisbehavior(misbehavior);
    url_ = sts_.HttpsUrlFor("localhost");
  }
  explicit BrokenEndpoint(int port) : url_("https://127.0.0.1:" + std::to_string(port) + "/sts") {}
  virtual ~BrokenEndpoint() = default;

  const std::string& Url() const { return url_; }
  const DevSts::Server& Sts() const { return sts_; }

 private:
  DevSts::Server sts_;
  std::string url_;
};

struct RefusedConnection : private Tarnik::Testing::Descriptor, public BrokenEndpoint {
  RefusedConnection() : BrokenEndpoint(Tarnik::Testing::RefusingPort(*this)) {}
};

struct BlackHole : private Tarnik::Testing::DeadListener, public BrokenEndpoint {
  BlackHole() : BrokenEndpoint(DeadListener::Port()) {}
};

DevSts::Misbehavior CutOffAfter(std::size_t bytes) {
  DevSts::Misbehavior misbehavior;
  misbehavior.cutOff = DevSts::CutOff{bytes, DevSts::CutStyle::Orderly};
  return misbehavior;
}

struct Case {
  const char* name;
  std::function<std::unique_ptr<BrokenEndpoint>()> make;
  FailureKind kind;
  bool isTrusted = true;
};

std::ostream& operator<<(std::ostream& stream, const Case& tested) {
  return stream << tested.name;
}

template <class Kind, class... Arguments>
std::function<std::unique_ptr<BrokenEndpoint>()> Makes(Arguments... arguments) {
  return [arguments...] { return std::make_unique<Kind>(arguments...); };
}

class FailoverAsyncTest : public EndToEndTest {
 protected:
  DevSts::Server healthy_;
};

class FailingEndpointAsyncTest : public FailoverAsyncTest,
                                 public testing::WithParamInterface<Case> {
 protected:
  std::shared_ptr<TokenSource> MakeWith(const BrokenEndpoint& broken) const {
    TokenSourceConfig config =
        GetParam().isTrusted ? Trusting({&broken.Sts(), &healthy_}) : Trusting({&healthy_});
    config.endpoints = {{broken.Url(), ""}, {healthy_.HttpsUrl(), ""}};
    // Also enough for the healthy endpoint on a busy machine.
    config.retry.attemptTimeout = 2s;
    return Make(config);
  }
};

TEST_P(FailingEndpointAsyncTest, CostsOneAttempt) {
  const auto broken = GetParam().make();
  const auto source = MakeWith(*broken);
  const Result result = Get(*source, SpecFor(0));
  ASSERT_NE(result.token, nullptr) << result.message;
  for (std::size_t i = 1; i < 6; ++i) {
    EXPECT_NE(Get(*source, SpecFor(i)).token, nullptr);
  }
  const auto attempts = AwaitEnded(7);
  ASSERT_EQ(attempts.size(), 7U);
  EXPECT_EQ(attempts[0].endpoint, broken->Url());
  EXPECT_STREQ(NameOf(attempts[0].failure), NameOf(GetParam().kind)) << attempts[0].message;
  for (std::size_t i = 1; i < attempts.size(); ++i) {
    EXPECT_EQ(attempts[i].endpoint, healthy_.HttpsUrl());
    EXPECT_EQ(attempts[i].failure, FailureKind::kNone);
    EXPECT_EQ(attempts[i].number, i == 1 ? 2 : 1);
  }
  EXPECT_LE(broken->Sts().Requests().size(), 1U);
}

INSTANTIATE_TEST_SUITE_P(
    Endpoints, FailingEndpointAsyncTest,
    testing::Values(
        Case{"Refused", Makes<RefusedConnection>(), FailureKind::kUnreachable},
        Case{"BlackHole", Makes<BlackHole>(), FailureKind::kTimedOut},
        Case{"WrongName",
             Makes<BrokenEndpoint>(DevSts::Misbehavior(), DevSts::ServerCertificate::WrongHost),
             FailureKind::kTlsName},
        Case{"UntrustedCa", Makes<BrokenEndpoint>(DevSts::Misbehavior()), FailureKind::kTlsTrust,
             false},
        Case{"Silent", Makes<BrokenEndpoint>(Stalling(DevSts::Stall::BeforeAnswer)),
             FailureKind::kTimedOut},
        Case{"SilentHandshake", Makes<BrokenEndpoint>(Stalling(DevSts::Stall::BeforeTlsHandshake)),
             FailureKind::kTimedOut},
        Case{"Busy", Makes<BrokenEndpoint>(Answering(503)), FailureKind::kHttpStatus},
        Case{"BusyForAWhile", Makes<BrokenEndpoint>(Answering(503, "3600")),
             FailureKind::kHttpStatus},
        Case{"ErrorWithoutAFault", Makes<BrokenEndpoint>(Answering(500)), FailureKind::kHttpStatus},
        Case{"Reset", Makes<BrokenEndpoint>(Resetting()), FailureKind::kUnreachable},
        Case{"CutOff", Makes<BrokenEndpoint>(CutOffAfter(700)), FailureKind::kCutOff}),
    [](const auto& tested) { return tested.param.name; });

TEST_F(FailoverAsyncTest, AFaultIsADecision) {
  DevSts::Server refusing;
  refusing.SetMisbehavior(Refusing("RequestFailed"));
  const auto source = Make(ConfigFor({&refusing, &healthy_}));
  const Result result = Get(*source, SpecFor(0));
  EXPECT_TRUE(result.Is<SsoException>()) << result.type;
  EXPECT_THAT(result.message, testing::StartsWith("Unexpected SOAP fault: "));
  EXPECT_EQ(refusing.Requests().size(), 1U);
  EXPECT_EQ(healthy_.GetCounters().connectionsAccepted, 0U);
  // Nothing is remembered.
  refusing.ClearMisbehavior();
  EXPECT_NE(Get(*source, SpecFor(0)).token, nullptr);
}

TEST_F(FailoverAsyncTest, ATokenThatDoesNotVerifyIsADecision) {
  DevSts::Server forging;
  DevSts::AssertionOptions options;
  options.afterSigning = [](std::string& assertion) {
    const auto at = assertion.find(">alice@");
    assertion.replace(at, 7, ">aliCe@");
  };
  forging.SetAssertionOptions(options);
  const auto source = Make(ConfigFor({&forging, &healthy_}));
  const Result result = Get(*source, SpecFor(0));
  EXPECT_TRUE(result.Is<InvalidSignatureException>()) << result.type << result.message;
  const auto attempts = AwaitEnded(1);
  ASSERT_EQ(attempts.size(), 1U);
  EXPECT_EQ(attempts[0].failure, FailureKind::kBadToken);
  EXPECT_EQ(forging.Requests().size(), 1U);
  EXPECT_EQ(healthy_.GetCounters().connectionsAccepted, 0U);
}

TEST_F(FailoverAsyncTest, WhenAllFailTheMessageHasEachReason) {
  DevSts::Server busy;
  busy.SetMisbehavior(Answering(503));
  healthy_.SetMisbehavior(Answering(500));
  TokenSourceConfig config = ConfigFor({&busy, &healthy_});
  config.retry.firstDelay = 1ms;
  const auto source = Make(config);
  const Result result = Get(*source, SpecFor(0));
  EXPECT_TRUE(result.Is<SsoException>()) << result.type;
  EXPECT_THAT(result.message, HasSubstr(busy.HttpsUrl() + ": http-status: Server returned error: "
                                                          "503 Busy"));
  EXPECT_THAT(result.message, HasSubstr(healthy_.HttpsUrl() + ": http-status: "));
  EXPECT_EQ(busy.Requests().size(), 2U);
  EXPECT_EQ(healthy_.Requests().size(), 2U);
}

TEST_F(FailoverAsyncTest, AnEndpointThatAsksForTimeIsNotAskedMeanwhile) {
  DevSts::Server busy;
  busy.SetMisbehavior(Answering(503, "3600"));
  TokenSourceConfig config = ConfigFor({&busy, &healthy_});
  config.retry.firstDelay = config.retry.longestDelay = 1ms;
  config.retry.failuresToOpen = config.retry.attempts + 1;
  const auto source = Make(config);
  ASSERT_NE(Get(*source, SpecFor(0)).token, nullptr);
  healthy_.SetMisbehavior(Resetting());
  const Result result = Get(*source, SpecFor(1));
  EXPECT_TRUE(result.Is<CommunicationException>()) << result.type;
  EXPECT_THAT(result.message, HasSubstr(busy.HttpsUrl() + ": left out for another "));
  EXPECT_THAT(result.message, HasSubstr(healthy_.HttpsUrl() + ": unreachable: "));
  EXPECT_EQ(busy.Requests().size(), 1U);
}

TEST_F(FailoverAsyncTest, AnOpenCircuitIsProbedAndCloses) {
  DevSts::Server other;
  TokenSourceConfig config = ConfigFor({&healthy_, &other});
  config.retry.failuresToOpen = 1;
  // The pause before a probe is random, and at least half of this.
  config.retry.firstDelay = config.retry.longestDelay = 1ms;
  config.retry.attempts = 100;
  healthy_.SetMisbehavior(Resetting());
  other.SetMisbehavior(Resetting());
  const auto source = Make(config);
  EXPECT_TRUE(Get(*source, SpecFor(0)).Is<CommunicationException>());
  healthy_.ClearMisbehavior();
  // The call after the pause is the probe.
  Result result;
  const auto limit = std::chrono::steady_clock::now() + 1min;
  for (std::size_t i = 1; result.token == nullptr && std::chrono::steady_clock::now() < limit;
       ++i) {
    result = Get(*source, SpecFor(i));
  }
  ASSERT_NE(result.token, nullptr) << result.message;
  for (const CircuitState state :
       {CircuitState::kOpen, CircuitState::kHalfOpen, CircuitState::kClosed}) {
    EXPECT_TRUE(AwaitCircuit(healthy_.HttpsUrl(), state));
  }
  const auto others = other.Requests().size();
  EXPECT_NE(Get(*source, SpecFor("https://after.example.com")).token, nullptr);
  EXPECT_EQ(other.Requests().size(), others);
}

}  // namespace
}  // namespace SsoClient::Access::Testing
