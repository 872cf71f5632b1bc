// Sources that log in by Kerberos, at several services of one realm.
#include <memory>
#include <mutex>
#include <string>
#include <vector>

#include <gmock/gmock.h>

#include <ssoclient/access/token_source.h>

#include "end_to_end/end_to_end_fixture.h"
#include "negotiation/realm_fixture.h"

namespace SsoClient::Access::Testing {
namespace {

using SsoClient::Testing::TwoLegs;
using testing::ElementsAre;

class NegotiatedSourceAsyncTest : public SsoClient::Testing::RealmTest {
 protected:
  NegotiatedSourceAsyncTest() {
    Sts().SetNegotiationScript(TwoLegs());
    second_.SetNegotiationScript(TwoLegs());
  }

  /// A service of the realm with the key of `Sts()`.
  static DevSts::ServerOptions SameKey() {
    DevSts::ServerOptions options;
    options.negotiation.keytab = ServiceKeytab();
    return options;
  }
  std::shared_ptr<TokenSource> Make() {
    TokenSourceConfig config = ConfigFor({&Sts(), &second_});
    config.listener = listener_;
    config.login = NegotiatedLogin{[this](const Endpoint& endpoint) {
      const std::lock_guard lock(mutex_);
      handlersFor_.push_back(endpoint.url);
      return Alice();
    }};
    return CreateTokenSource(config);
  }
  static std::vector<unsigned> OrdinalsOf(const DevSts::Server& server) {
    std::vector<unsigned> ordinals;
    for (const auto& request : server.Requests()) {
      ordinals.push_back(request.leg ? request.leg->ordinal : 0);
    }
    return ordinals;
  }

  DevSts::Server second_{SameKey()};
  const std::shared_ptr<AwaitingListener> listener_ = std::make_shared<AwaitingListener>();
  std::mutex mutex_;
  std::vector<std::string> handlersFor_;
};

TEST_F(NegotiatedSourceAsyncTest, LogsIn) {
  const auto source = Make();
  const Result result = Get(*source, SpecFor(0));
  ASSERT_NE(result.token, nullptr) << result.message;
  EXPECT_EQ(result.token->Subject().name, "alice");
  EXPECT_THAT(OrdinalsOf(Sts()), ElementsAre(1, 2));
  EXPECT_TRUE(second_.Requests().empty());
}

TEST_F(NegotiatedSourceAsyncTest, BeginsAnewAtTheNextEndpointWhenTheFirstDiesBetweenTwoLegs) {
  Sts().MisbehaveNext({});
  Sts().MisbehaveNext(Resetting());
  const auto source = Make();
  const Result result = Get(*source, SpecFor(0));
  ASSERT_NE(result.token, nullptr) << result.message;
  EXPECT_EQ(result.token->Subject().name, "alice");
  EXPECT_THAT(OrdinalsOf(Sts()), ElementsAre(1, 2));
  EXPECT_THAT(OrdinalsOf(second_), ElementsAre(1, 2));
  EXPECT_THAT(handlersFor_, ElementsAre(Sts().HttpsUrl(), second_.HttpsUrl()));
  ASSERT_TRUE(listener_->Await([](const Records& seen) { return seen.ended.size() == 2; }));
  const auto attempts = listener_->Seen().ended;
  EXPECT_EQ(attempts[0].failure, FailureKind::kUnreachable) << attempts[0].message;
  EXPECT_EQ(attempts[1].failure, FailureKind::kNone);
}

TEST_F(NegotiatedSourceAsyncTest, ManyCallersShareOneNegotiation) {
  const auto source = Make();
  TokenCalls calls;
  for (int i = 0; i < 200; ++i) {
    calls.Begin(*source, SpecFor(0));
  }
  for (const Result& result : calls.Wait()) {
    EXPECT_NE(result.token, nullptr) << result.message;
  }
  EXPECT_THAT(OrdinalsOf(Sts()), ElementsAre(1, 2));
  EXPECT_EQ(handlersFor_.size(), 1U);
}

TEST_F(NegotiatedSourceAsyncTest, ARefusedNegotiationIsADecision) {
  DevSts::NegotiationScript script = TwoLegs();
  script.failAtLeg = 2;
  Sts().SetNegotiationScript(script);
  const auto source = Make();
  const Result result = Get(*source, SpecFor(0));
  EXPECT_TRUE(result.Is<InvalidCredentialsException>()) << result.type << result.message;
  EXPECT_TRUE(second_.Requests().empty());
}

}  // namespace
}  // namespace SsoClient::Access::Testing
