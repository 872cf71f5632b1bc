// The kind of a failure, wherever it is reported.
#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>

#include "support/source_fixture.h"

namespace SsoClient::Access::Testing {

namespace {

using Limit = Tarnik::Http::CallLimit;

// A refusal whose class does not say so.
AttemptOutcome Unauthorised() {
  return Failed<CommunicationException>(FailureKind::kRefusedLogin,
                                        "Server returned error: 401 Unauthorized");
}

class FailureKindsTest : public SourceFixture {
 protected:
  std::uint64_t AttemptsOf(FailureKind kind) const {
    return source->Metrics().attempts[static_cast<std::size_t>(kind)];
  }
};

TEST_F(FailureKindsTest, RefusalByStatusIsOneWhenItIsAnsweredFromMemory) {
  config.keepFresh = {spec};
  ForAll(Fails(Unauthorised()));
  Make();
  runtime->Advance(minutes(4));
  const auto refreshes = listener->Refreshes();
  ASSERT_GE(refreshes.size(), 4U);
  for (const RefreshFailureRecord& record : refreshes) {
    EXPECT_EQ(record.failure, FailureKind::kRefusedLogin);
    EXPECT_EQ(record.message, "Server returned error: 401 Unauthorized");
  }
  EXPECT_EQ(Attempts(), 1U);
  EXPECT_EQ(AttemptsOf(FailureKind::kRefusedLogin), 1U);
  EXPECT_EQ(AttemptsOf(FailureKind::kUnreachable), 0U);
  EXPECT_EQ(source->Metrics().refusedFromMemory, refreshes.size() - 1);
  // The class is that of the client.
  EXPECT_TRUE(Get(spec).Is<CommunicationException>());
}

TEST_F(FailureKindsTest, RefusalByStatusIsSharedByThoseWhoWaitForTheGate) {
  ForAll([this](const AttemptRequest&, Limit&) {
    runtime->Settle();
    return Unauthorised();
  });
  Make();
  std::vector<std::shared_ptr<Reply>> replies;
  for (int i = 0; i < 20; ++i) {
    replies.push_back(Ask(SpecFor(std::to_string(i))));
  }
  runtime->Settle();
  EXPECT_EQ(Attempts(), 1U);
  for (const auto& reply : replies) {
    ASSERT_TRUE(reply->Has());
    EXPECT_EQ(reply->Message(), "Server returned error: 401 Unauthorized");
  }
  EXPECT_EQ(source->Metrics().refusedFromMemory, 19U);
}

TEST_F(FailureKindsTest, RefreshFailsWithTheKindOfItsAttempt) {
  const std::pair<FailureKind, AttemptOutcome> failures[] = {
      {FailureKind::kTimedOut, Failed<CommunicationException>(FailureKind::kTimedOut, "silent")},
      {FailureKind::kTlsName, Failed<CommunicationException>(FailureKind::kTlsName, "name")},
      {FailureKind::kHttpStatus, Failed<SsoException>(FailureKind::kHttpStatus, "status")},
      {FailureKind::kBadAnswer, Failed<CommunicationException>(FailureKind::kBadAnswer, "bad")},
      {FailureKind::kBadToken, Failed<SsoException>(FailureKind::kBadToken, "token")},
      {FailureKind::kFault, Failed<CommunicationException>(FailureKind::kFault, "fault")}};
  for (const std::size_t endpoints : {1U, 2U}) {
    config.endpoints.resize(endpoints);
    for (const auto& [kind, outcome] : failures) {
      config.keepFresh = {spec};
      listener = std::make_shared<RecordingListener>();
      config.listener = listener;
      ForAll(Fails(outcome));
      Make();
      runtime->Settle();
      ASSERT_EQ(listener->Refreshes().size(), 1U);
      EXPECT_STREQ(NameOf(listener->Refreshes()[0].failure), NameOf(kind));
      source->Stop(milliseconds(0));
    }
  }
}

TEST_F(FailureKindsTest, LoginsFunctionThatFailsInARefresh) {
  config.login = PasswordLogin{"alice", []() -> std::string { throw CommunicationException("?"); }};
  config.keepFresh = {spec};
  Make();
  runtime->Settle();
  ASSERT_EQ(listener->Refreshes().size(), 1U);
  EXPECT_EQ(listener->Refreshes()[0].failure, FailureKind::kSecretFailed);
}

TEST_F(FailureKindsTest, FailureOfTheSourceOfATokenToExchangeKeepsItsKind) {
  config.keepFresh = {spec};
  ForAll(Fails(Unauthorised()));
  const TokenSourceConfig outer = config;
  config.keepFresh.clear();
  config.listener = nullptr;
  Make();
  TokenLogin login;
  login.source = source;
  login.spec = SpecFor("https://base.example.com");
  config = outer;
  config.login = login;
  config.holderOfKey = HolderOfKeyConfig{Tarnik::MakeRef<NamedCertificate>("own"), nullptr};
  Make();
  runtime->Settle();
  ASSERT_EQ(listener->Refreshes().size(), 1U);
  EXPECT_EQ(listener->Refreshes()[0].failure, FailureKind::kRefusedLogin);
  EXPECT_EQ(Attempts(), 1U);
  EXPECT_TRUE(Get(spec).Is<CommunicationException>());
}

TEST_F(FailureKindsTest, SummaryHasTheClassOfTheLastFailure) {
  config.retry.attempts = 2;
  scripts[0]->Set(Fails(Unreachable()));
  scripts[1]->Set(Fails(Failed<SsoException>(FailureKind::kHttpStatus, "500 without a fault")));
  Make();
  EXPECT_TRUE(Get(spec).Is<SsoException>());
  scripts[0]->Set(Fails(Failed<SsoException>(FailureKind::kHttpStatus, "500 without a fault")));
  scripts[1]->Set(
      Fails(Failed<CommunicationException>(FailureKind::kTimedOut, "No answer in time.")));
  EXPECT_TRUE(Get(spec).Is<CommunicationException>());
}

}  // namespace

}  // namespace SsoClient::Access::Testing
