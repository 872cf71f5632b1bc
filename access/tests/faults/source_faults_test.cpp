// Single allocations that fail while a source works in the background, or ends.
#include <utility>

#include "faults/fault_case.h"

namespace SsoClient::Access::Testing {
namespace {

using Limit = Tarnik::Http::CallLimit;

void MakeAskedFor(FaultCase& tested) {
  tested.config.refresh.jitter = 0;
  tested.Make();
  ASSERT_NE(tested.Get(tested.spec).token, nullptr);
  ASSERT_NE(tested.source->TryGetToken(tested.spec), nullptr);
}

// The token is served, and the refresh is made up for.
void CheckRefreshed(FaultCase& tested, bool) {
  const auto before = tested.source->TryGetToken(tested.spec);
  ASSERT_NE(before, nullptr);
  tested.runtime->Advance(minutes(13));
  const auto after = tested.source->TryGetToken(tested.spec);
  ASSERT_NE(after, nullptr);
  EXPECT_EQ(tested.source->Metrics().misses, 1U);
  // One more when there was no memory to keep a token.
  const auto successes = tested.source->Metrics().logins + tested.source->Metrics().renewals;
  EXPECT_GE(successes, 2U);
  EXPECT_LE(successes, 3U);
  ExpectWorks(tested);
}

void RunToRefresh(FaultCase& tested) {
  tested.runtime->Advance(minutes(46));
}

TEST(SourceFaultsTest, Refresh) {
  EXPECT_GT(FailEachAllocation({MakeAskedFor, RunToRefresh, CheckRefreshed}), 10U);
}

TEST(SourceFaultsTest, Renewal) {
  const auto own = Tarnik::MakeRef<NamedCertificate>("own");
  const auto prepare = [&own](FaultCase& tested) {
    tested.config.holderOfKey = HolderOfKeyConfig{own, nullptr};
    tested.ForAll([&tested, &own](const AttemptRequest&, Limit&) {
      const auto token = tested.NewToken(hours(1));
      token->isRenewable = true;
      token->certificate = own;
      return Issued(token);
    });
    MakeAskedFor(tested);
  };
  EXPECT_GT(FailEachAllocation({prepare, RunToRefresh, CheckRefreshed}), 10U);
}

TEST(SourceFaultsTest, RefreshThatFails) {
  const auto prepare = [](FaultCase& tested) {
    MakeAskedFor(tested);
    tested.ForAll(tested.Fails(Unreachable()));
  };
  const auto check = [](FaultCase& tested, bool hasHappened) {
    tested.ForAll(tested.Issues(hours(1)));
    CheckRefreshed(tested, hasHappened);
  };
  EXPECT_GT(FailEachAllocation({prepare, RunToRefresh, check}), 10U);
}

TEST(SourceFaultsTest, KeepFresh) {
  const auto prepare = [](FaultCase& tested) {
    tested.config.keepFresh = {tested.spec};
    tested.Make();
  };
  const auto run = [](FaultCase& tested) { tested.runtime->Settle(); };
  const auto check = [](FaultCase& tested, bool) {
    tested.runtime->Advance(minutes(2));
    EXPECT_NE(tested.source->TryGetToken(tested.spec), nullptr);
    ExpectWorks(tested);
  };
  EXPECT_GT(FailEachAllocation({prepare, run, check}), 10U);
}

// Stopping needs no memory at all.
TEST(SourceFaultsTest, Stop) {
  const auto prepare = [](FaultCase& tested) {
    tested.config.keepFresh = {tested.SpecFor("kept")};
    tested.ForAll(tested.Fails(Unreachable()));
    tested.Make();
    tested.Call(tested.first, tested.spec);
    tested.runtime->Settle();
    tested.Call(tested.second, tested.other);
    ASSERT_EQ(tested.source->Metrics().callersWaiting, 2U);
  };
  const auto run = [](FaultCase& tested) {
    tested.source->Stop(milliseconds(0));
    tested.runtime->Settle();
  };
  const auto check = [](FaultCase& tested, bool) {
    for (const CallEnd* end : {&tested.first, &tested.second}) {
      EXPECT_EQ(end->outcomes, 1);
      EXPECT_FALSE(end->hasToken || end->isOutOfMemory);
    }
    EXPECT_THROW(tested.source->GetToken(tested.spec, {}), Tarnik::InvalidStateException);
  };
  EXPECT_GT(FailEachAllocation({prepare, run, check}), 1U);
}

TEST(SourceFaultsTest, Invalidate) {
  const auto prepare = [](FaultCase& tested) {
    tested.config.keepFresh = {tested.spec};
    tested.Make();
    tested.runtime->Settle();
  };
  const auto run = [](FaultCase& tested) {
    try {
      tested.source->Invalidate(*tested.source->TryGetToken(tested.spec));
    } catch (const std::bad_alloc&) {
    }
  };
  const auto check = [](FaultCase& tested, bool) {
    tested.runtime->Settle();
    ExpectWorks(tested);
  };
  EXPECT_GT(FailEachAllocation({prepare, run, check}), 1U);
}

/// Always returns the same token, at once.
class BaseSource final : public TokenSource {
 public:
  std::shared_ptr<const SamlToken> GetToken(const TokenSpec&, const CallContext&) override {
    return token_;
  }
  std::shared_ptr<const SamlToken> TryGetToken(const TokenSpec&) override { return token_; }
  void GetTokenAsync(const TokenSpec&, const CallContext&, TokenCallback callback) override {
    callback(token_, nullptr);
  }
  void Invalidate(const SamlToken&) override {}
  TokenSourceMetrics Metrics() const override { return {}; }
  bool Stop(milliseconds) override { return true; }

 private:
  const std::shared_ptr<const SamlToken> token_ = std::make_shared<IssuedToken>("_base", 0, 1);
};

TEST(SourceFaultsTest, Exchange) {
  const auto prepare = [](FaultCase& tested) {
    TokenLogin login;
    login.source = std::make_shared<BaseSource>();
    login.spec = tested.spec;
    tested.config.login = login;
    tested.config.holderOfKey =
        HolderOfKeyConfig{Tarnik::MakeRef<NamedCertificate>("own"), nullptr};
    // The first token is refused.
    tested.scripts[0]->Set([&tested](const AttemptRequest&, Limit&) {
      return tested.Attempts() == 1 ? Refused() : Issued(tested.NewToken(hours(1)));
    });
    tested.Make();
  };
  const auto run = [](FaultCase& tested) {
    tested.Call(tested.first, tested.spec);
    tested.runtime->Settle();
  };
  const auto check = [](FaultCase& tested, bool hasHappened) {
    ExpectOneOutcome(tested.first, hasHappened);
    ExpectWorks(tested);
  };
  EXPECT_GT(FailEachAllocation({prepare, run, check}), 10U);
}

}  // namespace
}  // namespace SsoClient::Access::Testing
