#include "waiter.h"

#include <future>

#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>

#include "support/issued_token.h"
#include "support/virtual_runtime.h"

namespace SsoClient::Access {

namespace {

Answer SomeToken() {
  return {std::make_shared<Testing::IssuedToken>("_1", 0, 1), {}};
}

TEST(BlockedCallerTest, WaitsForTheAnswerOfAnotherThread) {
  BlockedCaller caller{CallContext()};
  auto answered = std::async(std::launch::async, [&] { caller.Receive(SomeToken()); });
  EXPECT_EQ(caller.Wait().token->Id(), "_1");
  answered.get();
}

TEST(BlockedCallerTest, AnswerMayComeFirst) {
  BlockedCaller caller{CallContext()};
  caller.Receive({nullptr, Failure::Of(SsoException("no"))});
  EXPECT_THROW(caller.Wait().failure.Throw(), SsoException);
}

class CallbackCallerTest : public ::testing::Test {
 protected:
  std::shared_ptr<CallbackCaller> MakeCaller() {
    return std::make_shared<CallbackCaller>(
        CallContext(),
        [this](const Answer& answer) {
          ++calls;
          id = answer.token == nullptr ? "" : answer.token->Id();
          message = answer.failure.IsSet() ? answer.failure.ForCallback()->Message() : "";
          wasIdle = activity->WaitUntilIdle(std::chrono::milliseconds(0));
        },
        runtime, activity);
  }

  const std::shared_ptr<Testing::VirtualRuntime> runtime =
      std::make_shared<Testing::VirtualRuntime>();
  const std::shared_ptr<Activity> activity = std::make_shared<Activity>();
  int calls = 0;
  std::string id;
  std::string message;
  bool wasIdle = false;
};

TEST_F(CallbackCallerTest, RunsOnAWorkerAndCountsUntilItHasReturned) {
  MakeCaller()->Receive(SomeToken());
  EXPECT_EQ(calls, 0);
  EXPECT_FALSE(activity->WaitUntilIdle(std::chrono::milliseconds(0)));
  runtime->Settle();
  EXPECT_EQ(calls, 1);
  EXPECT_EQ(id, "_1");
  EXPECT_TRUE(wasIdle);  // but for its own thread
  EXPECT_TRUE(activity->WaitUntilIdle(std::chrono::milliseconds(0)));
}

TEST_F(CallbackCallerTest, FailuresAreReported) {
  MakeCaller()->Receive({nullptr, Failure(std::make_exception_ptr(std::runtime_error("why")))});
  runtime->Settle();
  EXPECT_EQ(message, "why");
}

TEST_F(CallbackCallerTest, RunsHereWithoutAWorker) {
  runtime->RefuseWork(true);
  MakeCaller()->Receive(SomeToken());
  EXPECT_EQ(calls, 1);
  EXPECT_TRUE(activity->WaitUntilIdle(std::chrono::milliseconds(0)));
}

TEST_F(CallbackCallerTest, OrThrowsWithoutAWorkerAndNeverRuns) {
  runtime->RefuseWork(true);
  EXPECT_THROW(MakeCaller()->ReceiveOrThrow(SomeToken()), Tarnik::ResourceException);
  EXPECT_EQ(calls, 0);
  EXPECT_TRUE(activity->WaitUntilIdle(std::chrono::milliseconds(0)));
}

TEST_F(CallbackCallerTest, WorkThatIsDroppedStillReports) {
  auto dropping = std::make_shared<Testing::VirtualRuntime>();
  auto caller = std::make_shared<CallbackCaller>(
      CallContext(), [this](const Answer&) { ++calls; }, dropping, activity);
  caller->Receive(SomeToken());
  caller.reset();
  EXPECT_EQ(calls, 0);
  dropping->DropWork();
  EXPECT_EQ(calls, 1);
  EXPECT_TRUE(activity->WaitUntilIdle(std::chrono::milliseconds(0)));
}

TEST_F(CallbackCallerTest, NobodyIsCalledWithoutAnAnswer) {
  MakeCaller();
  runtime->Settle();
  EXPECT_EQ(calls, 0);
}

}  // namespace

}  // namespace SsoClient::Access
