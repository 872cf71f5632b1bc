#ifndef SSOCLIENT_ACCESS_TESTS_FAULTS_FAULT_CASE_H
#define SSOCLIENT_ACCESS_TESTS_FAULTS_FAULT_CASE_H

#include <atomic>
#include <cstddef>
#include <functional>
#include <memory>
#include <new>

#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>
#include <tarnik/core/exception.h>

#include "faults/failing_allocation.h"
#include "support/source_fixture.h"

namespace SsoClient::Access::Testing {

/// Counts attempts, without memory.
class CountingListener final : public AccessListener {
 public:
  void OnAttemptBegun(const AttemptRecord&) override { ++begun; }
  void OnAttemptEnded(const AttemptRecord&) override { ++ended; }

  std::atomic<int> begun{0};
  std::atomic<int> ended{0};
};

/// How a call ended. Recording it needs no memory.
struct CallEnd {
  std::atomic<int> outcomes{0};  ///< callbacks, results and exceptions
  std::atomic<bool> hasToken{false};
  std::atomic<bool> isOutOfMemory{false};

  void Record(const SamlToken* token, const Tarnik::Exception* failure) noexcept {
    hasToken = token != nullptr;
    isOutOfMemory = dynamic_cast<const Tarnik::ResourceException*>(failure) != nullptr;
    ++outcomes;
  }
};

/// A source with one place for attempts at each of its two endpoints, so that one that is lost is
/// noticed.
class FaultCase : public SourceFixture {
 public:
  FaultCase() {
    config.listener = counts;
    config.retry.attemptsAtOnce = 1;
    config.retry.firstDelay = seconds(1);
  }
  void TestBody() override {}

  /// Calls `GetTokenAsync`.
  void Call(CallEnd& end, const TokenSpec& asked, const CallContext& context = {}) {
    try {
      source->GetTokenAsync(
          asked, context,
          [&end](const std::shared_ptr<const SamlToken>& token, const Tarnik::Exception* failure) {
            end.Record(token.get(), failure);
          });
    } catch (const std::bad_alloc&) {
      end.Record(nullptr, &Tarnik::OutOfMemory());
    } catch (const Tarnik::Exception& failure) {
      end.Record(nullptr, &failure);
    }
  }

  using SourceFixture::Ask;
  using SourceFixture::Attempts;
  using SourceFixture::Fails;
  using SourceFixture::ForAll;
  using SourceFixture::Get;
  using SourceFixture::Issues;
  using SourceFixture::Make;
  using SourceFixture::NewToken;
  using SourceFixture::SpecFor;
  using SourceFixture::Within;

  using SourceFixture::config;
  using SourceFixture::password;
  using SourceFixture::runtime;
  using SourceFixture::scripts;
  using SourceFixture::source;
  using SourceFixture::spec;

  const std::shared_ptr<CountingListener> counts = std::make_shared<CountingListener>();
  const TokenSpec other = SpecFor("https://other.example.com");
  CallEnd first;
  CallEnd second;
};

/// One way in which a source is used.
struct FaultScenario {
  /// Before the failure.
  std::function<void(FaultCase&)> prepare;
  /// Allocates.
  std::function<void(FaultCase&)> run;
  /// After the failure, with whether there was one.
  std::function<void(FaultCase&, bool)> check;
};

/// Runs a scenario with each of its allocations failing, until none fails. Afterwards, nobody
/// waits, what has begun has ended, and the source works.
inline std::size_t FailEachAllocation(const FaultScenario& scenario) {
  std::size_t index = 0;
  for (bool hasHappened = true; hasHappened; ++index) {
    SCOPED_TRACE(index);
    FaultCase tested;
    scenario.prepare(tested);
    {
      const FailingAllocation failure(index);
      scenario.run(tested);
      hasHappened = failure.HasHappened();
    }
    scenario.check(tested, hasHappened);
    EXPECT_EQ(tested.source->Metrics().callersWaiting, 0U);
    EXPECT_EQ(tested.counts->begun, tested.counts->ended);
    if (::testing::Test::HasFailure()) {
      break;
    }
  }
  return index;
}

/// After a call that ends within the scenario. It fails only for want of memory.
inline void ExpectOneOutcome(const CallEnd& end, bool hasHappened) {
  EXPECT_EQ(end.outcomes, 1);
  EXPECT_TRUE(end.hasToken || (hasHappened && end.isOutOfMemory));
}

/// The source gives tokens for a new spec and for an old one.
inline void ExpectWorks(FaultCase& tested) {
  tested.ForAll(tested.Issues(hours(1)));
  for (const TokenSpec& asked : {tested.SpecFor("https://new.example.com"), tested.spec}) {
    const auto reply = tested.Ask(asked);
    tested.runtime->Advance(minutes(2));
    ASSERT_TRUE(reply->Has());
    EXPECT_NE(reply->token, nullptr) << reply->Message();
  }
}

}  // namespace SsoClient::Access::Testing

#endif
