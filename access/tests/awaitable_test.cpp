#include <exception>
#include <string>
#include <thread>

#include <gtest/gtest.h>

#include <ssoclient/access/awaitable.h>

#include "support/source_fixture.h"

namespace SsoClient::Access::Testing {

namespace {

/// A coroutine that begins at once, and that nobody awaits.
struct Task {
  struct promise_type {
    Task get_return_object() const noexcept { return {}; }
    std::suspend_never initial_suspend() const noexcept { return {}; }
    std::suspend_never final_suspend() const noexcept { return {}; }
    void return_void() const noexcept {}
    void unhandled_exception() const noexcept { std::terminate(); }
  };
};

/// What a coroutine has received.
struct Received {
  bool hasEnded = false;
  std::shared_ptr<const SamlToken> token;
  std::string exception;
};

Task Receive(std::shared_ptr<TokenSource> source, TokenSpec spec, CallContext context,
             Received& received) {
  try {
    received.token = co_await AwaitToken(std::move(source), std::move(spec), std::move(context));
  } catch (const Tarnik::CancelledException&) {
    received.exception = "cancelled";
  } catch (const Tarnik::InvalidArgumentException&) {
    received.exception = "invalid argument";
  } catch (const Tarnik::InvalidStateException&) {
    received.exception = "invalid state";
  } catch (const Tarnik::ResourceException&) {
    received.exception = "no resource";
  }
  received.hasEnded = true;
}

class AwaitableTest : public SourceFixture {
 protected:
  Received Await(const CallContext& context) {
    Received received;
    Receive(source, spec, context, received);
    runtime->Settle();
    EXPECT_TRUE(received.hasEnded);
    return received;
  }
};

TEST_F(AwaitableTest, HitDoesNotSuspend) {
  Make();
  EXPECT_NE(Await({}).token, nullptr);
  Received received;
  Receive(source, spec, Within(minutes(1)), received);
  EXPECT_TRUE(received.hasEnded);
  EXPECT_NE(received.token, nullptr);
}

TEST_F(AwaitableTest, ContextCountsForAHitToo) {
  Make();
  Get(spec);
  const CancellationSource cancellation;
  CallContext cancelled;
  cancelled.cancellation = cancellation.Token();
  EXPECT_NE(Await(cancelled).token, nullptr);
  cancellation.Cancel();
  EXPECT_EQ(Await(cancelled).exception, "cancelled");
  CallContext late;
  late.deadline = CallContext::Clock::time_point::min();
  EXPECT_EQ(Await(late).exception, "invalid argument");
  CallContext negative;
  negative.minimumLife = seconds(-1);
  EXPECT_EQ(Await(negative).exception, "invalid argument");
}

TEST_F(AwaitableTest, CallThatThrowsContinuesTheCoroutine) {
  Make();
  runtime->RefuseWork(true);
  Received received;
  Receive(source, spec, {}, received);
  EXPECT_TRUE(received.hasEnded);
  EXPECT_EQ(received.exception, "no resource");
  runtime->RefuseWork(false);
  EXPECT_NE(Await({}).token, nullptr);
  source->Stop(milliseconds(0));
  EXPECT_EQ(Await({}).exception, "invalid state");
}

}  // namespace

}  // namespace SsoClient::Access::Testing
