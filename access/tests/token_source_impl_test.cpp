#include "token_source_impl.h"

#include <atomic>
#include <functional>
#include <memory>
#include <thread>
#include <utility>
#include <vector>

#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

#include "support/source_fixture.h"

namespace SsoClient::Access::Testing {

namespace {

class TokenSourceImplTest : public SourceFixture {
 protected:
  // The exit status of a child that runs `body` and ends with its result.
  template <class Body>
  static int InChild(const Body& body) {
    const pid_t child = fork();
    if (child == 0) {
      alarm(20);
      _exit(body());
    }
    int status = -1;
    EXPECT_EQ(waitpid(child, &status, 0), child);
    return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
  }
};

TEST_F(TokenSourceImplTest, ChildBeginsWithAnEmptyCache) {
  Make();
  const Reply reply = Get(spec);
  EXPECT_EQ(InChild([&] {
              if (source->TryGetToken(spec) != nullptr) {
                return 1;
              }
              const Reply own = Get(spec);
              return own.token != nullptr && own.token != reply.token ? 0 : 2;
            }),
            0);
  EXPECT_EQ(source->TryGetToken(spec), reply.token);
}

TEST_F(TokenSourceImplTest, ChildIsNotBlockedByWhatTheParentWasDoing) {
  config.keepFresh = {SpecFor("https://kept.example.com")};
  Make();
  int status = -1;
  scripts[0]->Set([&](const AttemptRequest&, Tarnik::Http::CallLimit&) {
    status = InChild([&] {
      ForAll(Issues(hours(1)));
      const Reply own = Get(spec);
      source->Stop(milliseconds(0));
      source.reset();
      return own.token != nullptr ? 0 : 1;
    });
    return Issued(NewToken(hours(1)));
  });
  const Reply reply = Get(spec);
  EXPECT_EQ(status, 0);
  EXPECT_EQ(reply.calls, 1);
  EXPECT_NE(reply.token, nullptr);
}

TEST_F(TokenSourceImplTest, ChildMayDestroyASourceThatItHasNotUsed) {
  Make();
  Get(spec);
  EXPECT_EQ(InChild([&] {
              source.reset();
              return 0;
            }),
            0);
}

TEST_F(TokenSourceImplTest, CallsOfTheParentAreNotAnsweredInTheChild) {
  Make();
  const auto reply = Ask(spec);
  EXPECT_EQ(InChild([&] {
              source.reset();
              runtime->DropWork();
              return reply->calls;
            }),
            0);
  runtime->Settle();
  EXPECT_EQ(reply->calls, 1);
}

TEST_F(TokenSourceImplTest, SourceThatWasStoppedIsStoppedInTheChild) {
  Make();
  source->Stop(milliseconds(0));
  EXPECT_EQ(InChild([&] {
              try {
                source->GetToken(spec, {});
              } catch (const Tarnik::InvalidStateException&) {
                return 0;
              }
              return 1;
            }),
            0);
}

// While a thread of the child makes a core, another thread makes the one that is used.
TEST_F(TokenSourceImplTest, OneOfTwoCoresThatThreadsOfAChildMakeIsUsed) {
  config.keepFresh = {spec};
  const auto shared = std::make_shared<const TokenSourceConfig>(config);
  bool isFirst = false;
  source = std::make_shared<TokenSourceImpl>([&] {
    if (std::exchange(isFirst, false)) {
      source->Metrics();
    }
    Core::Parts parts{shared, runtime, {}};
    for (std::size_t i = 0; i < shared->endpoints.size(); ++i) {
      parts.clients.push_back(std::make_unique<ScriptedEndpoint>(shared->endpoints[i], scripts[i]));
    }
    return parts;
  });
  runtime->Settle();
  const std::size_t before = Attempts();
  EXPECT_EQ(before, 1U);
  EXPECT_EQ(InChild([&] {
              isFirst = true;
              source->Metrics();
              runtime->Settle();
              return static_cast<int>(Attempts() - before);
            }),
            1);
}

TEST_F(TokenSourceImplTest, DestructionStopsTheSource) {
  Make();
  std::thread destroying;
  scripts[0]->Set([&](const AttemptRequest&, Tarnik::Http::CallLimit& limit) {
    destroying = std::thread([this] { source.reset(); });
    while (!limit.IsCancelled()) {
      std::this_thread::yield();
    }
    return Unreachable();
  });
  const auto reply = Ask(spec);
  runtime->RunUntil([&] { return reply->Has(); });
  destroying.join();
  EXPECT_TRUE(reply->Is<Tarnik::InvalidStateException>());
  EXPECT_EQ(reply->calls, 1);
  EXPECT_EQ(Attempts(), 1U);
}

/// Runs work on threads of its own, which keep it for a moment after it has run.
class LingeringRuntime final : public Runtime {
 public:
  ~LingeringRuntime() override {
    for (std::thread& thread : threads_) {
      thread.join();
    }
  }

  Instant Now() const override { return Instant::Now(); }
  double Draw() override { return 0.5; }
  void Run(std::function<void()> work) override {
    threads_.emplace_back([this, work = std::move(work)]() mutable {
      work();
      isReleased_.wait(false);
      std::this_thread::sleep_for(milliseconds(20));
      work = nullptr;
    });
  }
  Tarnik::Ref<Tarnik::System::CancellableItem> RunAt(Instant::Steady,
                                                     std::function<void()>) override {
    return nullptr;
  }
  void Release() {
    isReleased_ = true;
    isReleased_.notify_all();
  }

 private:
  std::vector<std::thread> threads_;
  std::atomic<bool> isReleased_{false};
};

// Their code may be that of a plug-in, which is unloaded next.
TEST_F(TokenSourceImplTest, NothingOfTheUserIsLeftAfterTheDestruction) {
  const auto lingering = std::make_shared<LingeringRuntime>();
  auto kept = std::make_shared<const TokenSourceConfig>(config);
  const std::weak_ptr<const TokenSourceConfig> left = kept;
  ForAll(Issues(hours(1)));
  auto own = std::make_unique<TokenSourceImpl>(
      [lingering, script = scripts[0], kept = std::exchange(kept, nullptr)] {
        Core::Parts parts{kept, lingering, {}};
        parts.clients.push_back(std::make_unique<ScriptedEndpoint>(kept->endpoints[0], script));
        return parts;
      });
  EXPECT_NE(own->GetToken(spec, {}), nullptr);
  lingering->Release();
  own.reset();
  EXPECT_TRUE(left.expired());
}

}  // namespace

}  // namespace SsoClient::Access::Testing
