#include <chrono>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <tarnik/core/exception.h>
#include <tarnik/http/bounded_user_agent.h>
#include <tarnik/http/http_user_agent.h>

#include "http/exchange_fixture.h"
#include "support/scripted_spec.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Http;
using namespace std::chrono_literals;
using Clock = CallLimit::Clock;

class BoundedUserAgentAsyncTest : public ExchangeFixture {
 protected:
  void Bound(ScriptedSpec::Script script, Clock::time_point deadline) {
    Use(std::move(script));
    inner_ = agent_;
    limit_ = CreateCallLimit(deadline);
    agent_ = CreateBoundedUserAgent(inner_.get(), limit_.get());
  }
  void TearDown() override {
    inner_ = nullptr;
    ExchangeFixture::TearDown();
  }

  /// Never connects; for one exchange.
  static ScriptedSpec::Script Silent() {
    ScriptedSpec::Script script;
    script.holdConnects = true;
    return script;
  }
  static ScriptedSpec::Script Answering() {
    ScriptedSpec::Script script;
    script.stream.onWritten = AnswerWith(kHello);
    return script;
  }

  Ref<UserAgent> inner_;
  Ref<CallLimit> limit_;
};

TEST_F(BoundedUserAgentAsyncTest, PassesAnswersAndFailuresOn) {
  Bound(Answering(), Clock::now() + 1h);
  EXPECT_EQ(ExchangeOnce(), "hello");
  ScriptedSpec::Script failing;
  failing.connectError = "no such service";
  Bound(failing, Clock::time_point::max());
  EXPECT_EQ(ExchangeOnce(), "no such service");
}

TEST_F(BoundedUserAgentAsyncTest, EndsAnExchangeAtTheDeadlineWhateverTheCallerAsksFor) {
  const std::vector<unsigned long> requested = {0, kPlentyOfTime};
  for (const unsigned long sendLimit : requested) {
    for (const unsigned long waitLimit : requested) {
      const auto deadline = Clock::now() + 20ms;
      Bound(Silent(), deadline);
      const auto record = std::make_shared<CompletionRecord>();
      const auto item = Send(record, sendLimit);
      EXPECT_THROW(agent_->Wait(item.get(), waitLimit), TimeoutException);
      EXPECT_GE(Clock::now(), deadline);
      EXPECT_EQ(record->count, 1);
      EXPECT_THAT(record->message,
                  testing::MatchesRegex("The caller's deadline has passed. No answer from "
                                        "sts.example:443 within [0-9]+ milliseconds: waiting for "
                                        "the connection."));
    }
  }
}

TEST_F(BoundedUserAgentAsyncTest, EndsAnExchangeThatNobodyWaitsFor) {
  Bound(Silent(), Clock::now() + 200ms);
  const auto record = std::make_shared<CompletionRecord>();
  Send(record, kPlentyOfTime);
  EXPECT_TRUE(Eventually([&] { return record->count == 1; }));
  EXPECT_THAT(record->message, testing::StartsWith("The caller's deadline has passed. "));
}

TEST_F(BoundedUserAgentAsyncTest, KeepsAShorterLimitOfTheCaller) {
  Bound(Silent(), Clock::now() + 1h);
  const auto record = std::make_shared<CompletionRecord>();
  const auto item = Send(record, 5000);
  EXPECT_THROW(agent_->Wait(item.get(), kPlentyOfTime), TimeoutException);
  const std::string shorter =
      "No answer from sts.example:443 within 5 milliseconds: waiting for the connection.";
  EXPECT_EQ(record->message, shorter);
}

TEST_F(BoundedUserAgentAsyncTest, RefusesExchangesAfterTheDeadline) {
  Bound(Answering(), Clock::now());
  EXPECT_EQ(ExchangeOnce(), "The caller's deadline has passed.");
  EXPECT_EQ(spec_->ConnectCount(), 0U);
  EXPECT_THROW(agent_->Wait(Send().get(), 0), TimeoutException);
}

TEST_F(BoundedUserAgentAsyncTest, CancelEndsTheExchangesUnderWayAndRefusesLaterOnes) {
  Bound({}, Clock::time_point::max());
  const auto record = std::make_shared<CompletionRecord>();
  const auto first = Send(record);
  const auto second = inner_->SendAsync(PostRequest().get(), RecordIn(record), 0);
  EXPECT_FALSE(limit_->IsCancelled());
  limit_->Cancel();
  limit_->Cancel();
  EXPECT_TRUE(limit_->IsCancelled());
  EXPECT_THROW(agent_->Wait(first.get(), 0), CancelledException);
  EXPECT_EQ(record->count, 1) << "an exchange that is not under the limit goes on";
  EXPECT_EQ(record->message,
            "The call was cancelled by its caller. The request to sts.example:443 was cancelled.");
  EXPECT_EQ(record->item, first.get());
  second->Cancel();

  const auto refused = Send();
  EXPECT_THROW(agent_->Wait(refused.get(), 0), CancelledException);
  EXPECT_FALSE(refused->Cancel());
  EXPECT_EQ(ExchangeOnce(), "The call was cancelled by its caller.");
  EXPECT_TRUE(Eventually([&] { return record->count == 2; }));
}

TEST_F(BoundedUserAgentAsyncTest, LimitKnowsTheStageOfTheExchangeThatWasStartedLast) {
  Bound(Silent(), Clock::time_point::max());
  EXPECT_EQ(limit_->Stage(), ExchangeStage::kNone);
  const auto first = Send();
  EXPECT_EQ(limit_->Stage(), ExchangeStage::kConnection);
  limit_->Cancel();
  EXPECT_THROW(agent_->Wait(first.get(), 0), CancelledException);
  EXPECT_EQ(limit_->Stage(), ExchangeStage::kNone);
}

TEST_F(BoundedUserAgentAsyncTest, LimitKnowsTheStagesOfAnAnswer) {
  Bound({}, Clock::time_point::max());
  const auto item = Send();
  EXPECT_TRUE(Eventually([&] { return limit_->Stage() == ExchangeStage::kAnswer; }));
  spec_->Streams().front()->Push("HTTP/1.1 200 OK\r\nContent-Length: 5\r\n\r\nhe");
  EXPECT_TRUE(Eventually([&] { return limit_->Stage() == ExchangeStage::kRestOfAnswer; }));
  spec_->Streams().front()->Push("llo");
  agent_->Wait(item.get(), 0);
  EXPECT_EQ(limit_->Stage(), ExchangeStage::kNone);
}

TEST_F(BoundedUserAgentAsyncTest, AnItemCancelsOnlyItsExchange) {
  Bound({}, Clock::now() + 1h);
  const auto record = std::make_shared<CompletionRecord>();
  const auto first = Send(record);
  const auto second = Send();
  EXPECT_TRUE(first->Cancel());
  EXPECT_FALSE(first->Cancel());
  EXPECT_THROW(agent_->Wait(first.get(), 0), CancelledException);
  EXPECT_TRUE(second->Cancel());
}

TEST_F(BoundedUserAgentAsyncTest, CompletesOnceWheneverItIsCancelled) {
  for (int i = 0; i < 100; ++i) {
    Bound(Answering(), Clock::now() + 1h);
    const auto record = std::make_shared<CompletionRecord>();
    std::thread canceller([limit = limit_] { limit->Cancel(); });
    const auto item = Send(record);
    canceller.join();
    try {
      agent_->Wait(item.get(), 0);
    } catch (const CancelledException&) {
      EXPECT_EQ(record->responseCount, 0);
    }
    EXPECT_EQ(record->count, 1);
  }
}

TEST_F(BoundedUserAgentAsyncTest, RefusesUnusableArguments) {
  Bound(Answering(), Clock::now() + 1h);
  EXPECT_THROW(CreateBoundedUserAgent(nullptr, limit_.get()), InvalidArgumentException);
  EXPECT_THROW(CreateBoundedUserAgent(agent_.get(), nullptr), InvalidArgumentException);
  EXPECT_THROW(agent_->SendAsync(PostRequest().get(), {}, 0), InvalidArgumentException);
  EXPECT_THROW(agent_->SendAsync(nullptr, RecordIn(std::make_shared<CompletionRecord>()), 0),
               InvalidArgumentException);
  const auto foreign = inner_->SendAsync(
      PostRequest().get(), RecordIn(std::make_shared<CompletionRecord>()), kPlentyOfTime);
  EXPECT_THROW(agent_->Wait(foreign.get(), 0), TypeMismatchException);
  inner_->Wait(foreign.get(), 0);
}

}  // namespace
}  // namespace Tarnik::Testing
