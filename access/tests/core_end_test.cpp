#include <algorithm>
#include <atomic>
#include <chrono>
#include <functional>
#include <future>
#include <memory>
#include <thread>
#include <utility>

#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>

#include "core.h"
#include "support/source_fixture.h"

namespace SsoClient::Access::Testing {

namespace {

using Limit = Tarnik::Http::CallLimit;

class CoreEndTest : public SourceFixture {};

TEST_F(CoreEndTest, StopEndsCallersAndLaterCalls) {
  Make();
  const Reply cached = Get(spec);
  ForAll(Fails(Unreachable()));
  const auto waiting = Ask(SpecFor("https://stock.example.com"));
  runtime->Settle();
  ASSERT_FALSE(waiting->Has());
  const auto stopped = std::async(std::launch::async, [this] { return source->Stop(seconds(60)); });
  // The callback that `Stop` waits for is work of this thread.
  runtime->RunUntil([&] { return waiting->Has(); });
  EXPECT_TRUE(waiting->Is<Tarnik::InvalidStateException>());
  stopped.wait();
  EXPECT_THROW(source->GetToken(spec, {}), Tarnik::InvalidStateException);
  EXPECT_THROW(source->TryGetToken(spec), Tarnik::InvalidStateException);
  EXPECT_TRUE(Get(spec).Is<Tarnik::InvalidStateException>());
  EXPECT_TRUE(source->Stop(milliseconds(0)));
  const std::size_t attempts = Attempts();
  runtime->Advance(hours(2));
  EXPECT_EQ(Attempts(), attempts);
  EXPECT_EQ(runtime->TimersArmed(), 0U);
}

TEST_F(CoreEndTest, StopCancelsTheExchange) {
  Make();
  bool isCancelled = false;
  scripts[0]->Set([&](const AttemptRequest&, Limit& limit) {
    source->Stop(milliseconds(0));
    isCancelled = limit.IsCancelled();
    return Issued(NewToken(hours(1)));
  });
  const Reply reply = Get(spec);
  EXPECT_TRUE(isCancelled);
  EXPECT_EQ(reply.calls, 1);
  EXPECT_TRUE(reply.Is<Tarnik::InvalidStateException>());
}

TEST_F(CoreEndTest, StopInACallbackDoesNotWaitForItself) {
  Make();
  bool wasIdle = false;
  source->GetTokenAsync(
      spec, {}, [&](const auto&, const Tarnik::Exception*) { wasIdle = source->Stop(hours(1)); });
  runtime->Settle();
  EXPECT_TRUE(wasIdle);
}

TEST_F(CoreEndTest, LastReferenceMayBeReleasedInACallback) {
  Make();
  int calls = 0;
  auto* const raw = source.get();
  auto last = std::make_shared<std::shared_ptr<TokenSourceImpl>>(std::move(source));
  raw->GetTokenAsync(spec, {}, [last, &calls](const auto&, const Tarnik::Exception*) {
    last->reset();
    ++calls;
  });
  runtime->Settle();
  EXPECT_EQ(calls, 1);
}

// Work runs on another thread, and has ended before `Run` returns: it is faster than the caller.
// What follows from it runs on the same thread. Whoever calls `Run` uses the core again, so that it
// must not be gone: as long as it exists, so does its configuration.
class ImmediateRuntime final : public Runtime {
 public:
  explicit ImmediateRuntime(std::weak_ptr<const TokenSourceConfig> config)
      : config_(std::move(config)) {}

  Instant Now() const override { return virtual_->Now(); }
  double Draw() override { return virtual_->Draw(); }
  void Run(std::function<void()> work) override {
    thread_local bool isWorker = false;
    if (isWorker) {
      work();
      return;
    }
    std::thread worker([work = std::move(work)]() mutable {
      isWorker = true;
      work();
      work = nullptr;
    });
    worker.join();
    EXPECT_FALSE(config_.expired()) << "The core was destroyed in a call.";
  }
  Tarnik::Ref<Tarnik::System::CancellableItem> RunAt(Instant::Steady time,
                                                     std::function<void()> action) override {
    return virtual_->RunAt(time, std::move(action));
  }

 private:
  const std::weak_ptr<const TokenSourceConfig> config_;
  const std::shared_ptr<VirtualRuntime> virtual_ = std::make_shared<VirtualRuntime>();
};

class FastWorkerTest : public CoreEndTest {
 protected:
  FastWorkerTest() { config.endpoints.resize(1); }

  std::unique_ptr<TokenSource> MakeFast() {
    const auto shared = std::make_shared<const TokenSourceConfig>(config);
    left_ = shared;
    return std::make_unique<TokenSourceImpl>([shared, scripts = scripts] {
      Core::Parts parts{shared, std::make_shared<ImmediateRuntime>(shared), {}};
      parts.clients.push_back(std::make_unique<ScriptedEndpoint>(shared->endpoints[0], scripts[0]));
      return parts;
    });
  }
  bool IsCoreGone() const { return left_.expired(); }

 private:
  std::weak_ptr<const TokenSourceConfig> left_;
};

TEST_F(FastWorkerTest, LastReferenceMayBeReleasedBeforeTheCallReturns) {
  std::unique_ptr<TokenSource> last = MakeFast();
  const CancellationSource cancellation;
  CallContext context;
  context.cancellation = cancellation.Token();
  TokenSource* const raw = last.get();
  int calls = 0;
  raw->GetTokenAsync(spec, context, [&](const auto&, const Tarnik::Exception*) {
    last.reset();
    Make();  // forgets what remains of the core
    ++calls;
  });
  EXPECT_EQ(calls, 1);
  EXPECT_EQ(last, nullptr);
  EXPECT_TRUE(IsCoreGone());
}

TEST_F(FastWorkerTest, ReleaseInACallbackDoesNotWaitForIt) {
  using Clock = std::chrono::steady_clock;
  auto best = Clock::duration::max();
  // It would wait for a second. Another program may delay a few rounds.
  for (int round = 0; round < 5 && best >= milliseconds(500); ++round) {
    std::unique_ptr<TokenSource> last = MakeFast();
    TokenSource* const raw = last.get();
    raw->GetTokenAsync(spec, {}, [&](const auto&, const Tarnik::Exception*) {
      const auto begun = Clock::now();
      last.reset();
      best = std::min(best, Clock::now() - begun);
    });
    EXPECT_EQ(last, nullptr);
  }
  EXPECT_LT(best, milliseconds(500));
}

TEST_F(FastWorkerTest, LastReferenceMayBeReleasedInACallbackOfStop) {
  ForAll(Fails(Unreachable()));
  std::unique_ptr<TokenSource> last = MakeFast();
  int calls = 0;
  last->GetTokenAsync(spec, {}, [&](const auto&, const Tarnik::Exception* failure) {
    EXPECT_NE(dynamic_cast<const Tarnik::InvalidStateException*>(failure), nullptr);
    last.reset();
    ++calls;
  });
  EXPECT_EQ(calls, 0);
  TokenSource* const raw = last.get();
  raw->Stop(milliseconds(0));
  EXPECT_EQ(calls, 1);
  EXPECT_TRUE(IsCoreGone());
}

TEST_F(FastWorkerTest, CancelMayReleaseItsSourceInTheCallback) {
  struct Session {
    std::unique_ptr<TokenSource> source;
    CancellationSource cancellation;
  };
  auto session = std::make_unique<Session>();
  session->source = MakeFast();
  TokenSource* const raw = session->source.get();
  CallContext context;
  context.cancellation = session->cancellation.Token();
  scripts[0]->Set([&](const AttemptRequest&, Limit&) {
    session->cancellation.Cancel();
    return Unreachable();
  });
  int calls = 0;
  raw->GetTokenAsync(spec, std::exchange(context, {}),
                     [&](const auto&, const Tarnik::Exception* failure) {
                       EXPECT_NE(dynamic_cast<const Tarnik::CancelledException*>(failure), nullptr);
                       session.reset();
                       ++calls;
                     });
  EXPECT_EQ(calls, 1);
  EXPECT_TRUE(IsCoreGone());
}

// A factory of the program may attach a function to the end of a token.
TEST_F(FastWorkerTest, InvalidatedTokenMayUseAndReleaseItsSource) {
  std::unique_ptr<TokenSource> last = MakeFast();
  const auto token = NewToken(hours(1));
  int ends = 0;
  const auto onEnd = [&](const SamlToken*) {
    EXPECT_EQ(last->Metrics().keys, 0U);
    last.reset();
    EXPECT_FALSE(IsCoreGone());
    ++ends;
  };
  scripts[0]->Set([&](const AttemptRequest&, Limit&) { return Issued({token.get(), onEnd}); });
  TokenSource* const raw = last.get();
  EXPECT_EQ(raw->GetToken(spec, {}).get(), token.get());
  EXPECT_EQ(ends, 0);
  raw->Invalidate(*token);
  EXPECT_EQ(ends, 1);
  EXPECT_TRUE(IsCoreGone());
}

TEST_F(CoreEndTest, CallbackNeverRunsInItsOwnCall) {
  Make();
  Get(spec);
  runtime->RefuseWork(true);
  CallContext tooLong;
  tooLong.minimumLife = hours(2);
  CallContext cancelled;
  const CancellationSource cancellation;
  cancelled.cancellation = cancellation.Token();
  cancellation.Cancel();
  bool hasRun = false;
  const auto callback = [&](const auto&, const Tarnik::Exception*) { hasRun = true; };
  EXPECT_THROW(source->GetTokenAsync(spec, tooLong, callback), Tarnik::ResourceException);
  EXPECT_THROW(source->GetTokenAsync(spec, cancelled, callback), Tarnik::ResourceException);
  EXPECT_THROW(source->GetTokenAsync(spec, {}, callback), Tarnik::ResourceException);
  EXPECT_THROW(source->GetTokenAsync(SpecFor("https://new.example.com"), {}, callback),
               Tarnik::ResourceException);
  EXPECT_FALSE(hasRun);
  runtime->RefuseWork(false);
  EXPECT_EQ(source->Metrics().callersWaiting, 0U);
  EXPECT_TRUE(source->Stop(milliseconds(0)));
}

TEST_F(CoreEndTest, StopReportsThatAFunctionIsStillRunning) {
  bool wasIdle = true;
  config.login =
      PasswordLogin{"alice", [&] {
                      std::thread other([&] { wasIdle = source->Stop(milliseconds(1)); });
                      other.join();
                      return password;
                    }};
  // Nobody waits for this one, so that no callback is due.
  config.keepFresh = {spec};
  Make();
  runtime->Settle();
  EXPECT_FALSE(wasIdle);
  EXPECT_TRUE(source->Stop(milliseconds(0)));
  EXPECT_EQ(Attempts(), 0U);
  EXPECT_TRUE(listener->Begun().empty());
}

TEST_F(CoreEndTest, ProcessEndEndsCallers) {
  const auto shared = std::make_shared<const TokenSourceConfig>(config);
  Core::Parts parts{shared, runtime, {}};
  for (const Endpoint& endpoint : config.endpoints) {
    parts.clients.push_back(std::make_unique<ScriptedEndpoint>(endpoint, scripts[0]));
  }
  const auto core = Core::Create(std::move(parts));
  std::thread ending;
  scripts[0]->Set([&](const AttemptRequest&, Limit& limit) {
    ending = std::thread([&core] { core->EndProcess(); });
    while (!limit.IsCancelled()) {
      std::this_thread::yield();
    }
    return Issued(NewToken(hours(1)));
  });
  int calls = 0;
  std::string message;
  core->GetTokenAsync(spec, {}, [&](const auto&, const Tarnik::Exception* failure) {
    ++calls;
    message = dynamic_cast<const CommunicationException&>(*failure).Message();
  });
  runtime->RunUntil([&] { return calls == 1; });
  ending.join();
  EXPECT_EQ(message, "The process is ending.");
  EXPECT_THROW(core->GetToken(spec, {}), CommunicationException);
}

}  // namespace

}  // namespace SsoClient::Access::Testing
