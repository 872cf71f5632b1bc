#include <memory>

#include <gtest/gtest.h>

#include <tarnik/core/exception.h>
#include <tarnik/http/http_user_agent.h>

#include "http/exchange_fixture.h"
#include "support/forked_child.h"

namespace Tarnik::Testing {
namespace {

class ForkedExchangeTest : public ExchangeFixture {};

TEST_F(ForkedExchangeTest, CannotBeAwaitedOrCancelledInAChild) {
  Use({});
  const auto record = std::make_shared<CompletionRecord>();
  const auto item = Send(record);
  ASSERT_TRUE(Eventually([&] { return spec_->Streams().size() == 1; }));
  EXPECT_TRUE(HoldsInChild([&] {
    try {
      agent_->Wait(item.get(), 0);
      return false;
    } catch (const InvalidStateException& refusal) {
      return refusal.Message() ==
                 "The request to sts.example:443 was begun in the parent process." &&
             !item->Cancel();
    }
  }));
  spec_->Streams().front()->Push(kHello);
  agent_->Wait(item.get(), kPlentyOfTime);
  EXPECT_EQ(record->body, "hello");
}

TEST_F(ForkedExchangeTest, DoesNotUseAConnectionThatTheParentKeeps) {
  UseAnswer(kHello);
  ExchangeOnce();
  EXPECT_TRUE(HoldsInChild([&] {
    return ExchangeOnce() == "hello" && spec_->ConnectCount() == 2 && ExchangeOnce() == "hello" &&
           spec_->ConnectCount() == 2;
  }));
  EXPECT_EQ(ExchangeOnce(), "hello");
  EXPECT_EQ(spec_->ConnectCount(), 1U);
}

}  // namespace
}  // namespace Tarnik::Testing
