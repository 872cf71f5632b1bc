// Single allocations that fail while calls are answered.
#include <stdexcept>
#include <thread>
#include <utility>

#include "faults/fault_case.h"

namespace SsoClient::Access::Testing {
namespace {

using Limit = Tarnik::Http::CallLimit;

void MakeSource(FaultCase& tested) {
  tested.Make();
}

void CallOnce(FaultCase& tested) {
  tested.Call(tested.first, tested.spec);
  tested.runtime->Settle();
}

void CallForTwoKeys(FaultCase& tested) {
  tested.Call(tested.first, tested.spec);
  tested.Call(tested.second, tested.other);
  tested.runtime->Settle();
}

void CheckFirst(FaultCase& tested, bool hasHappened) {
  ExpectOneOutcome(tested.first, hasHappened);
  ExpectWorks(tested);
}

void CheckBoth(FaultCase& tested, bool hasHappened) {
  ExpectOneOutcome(tested.first, hasHappened);
  ExpectOneOutcome(tested.second, hasHappened);
  ExpectWorks(tested);
}

TEST(CallFaultsTest, Miss) {
  EXPECT_GT(FailEachAllocation({MakeSource, CallOnce, CheckFirst}), 20U);
}

TEST(CallFaultsTest, Hit) {
  const auto prepare = [](FaultCase& tested) {
    tested.Make();
    ASSERT_NE(tested.Get(tested.spec).token, nullptr);
  };
  EXPECT_GT(FailEachAllocation({prepare, CallOnce, CheckFirst}), 1U);
}

TEST(CallFaultsTest, TwoCallersOfOneKey) {
  const auto run = [](FaultCase& tested) {
    tested.Call(tested.first, tested.spec, tested.Within(hours(1)));
    tested.Call(tested.second, tested.spec, tested.Within(hours(2)));
    tested.runtime->Settle();
  };
  const auto check = [](FaultCase& tested, bool hasHappened) {
    CheckBoth(tested, hasHappened);
    // All timers of callers are cancelled, or have fired.
    tested.runtime->Advance(hours(3));
    EXPECT_EQ(tested.first.outcomes, 1);
    EXPECT_EQ(tested.runtime->TimersArmed(), 0U);
  };
  EXPECT_GT(FailEachAllocation({MakeSource, run, check}), 20U);
}

TEST(CallFaultsTest, MinimumLifeThatIsNotGranted) {
  const auto run = [](FaultCase& tested) {
    CallContext context;
    context.minimumLife = hours(2);
    tested.Call(tested.first, tested.spec, context);
    tested.Call(tested.second, tested.spec);
    tested.runtime->Settle();
  };
  const auto check = [](FaultCase& tested, bool hasHappened) {
    EXPECT_EQ(tested.first.outcomes, 1);
    EXPECT_FALSE(tested.first.hasToken);
    ExpectOneOutcome(tested.second, hasHappened);
    ExpectWorks(tested);
  };
  EXPECT_GT(FailEachAllocation({MakeSource, run, check}), 20U);
}

TEST(CallFaultsTest, FailoverAndPause) {
  const auto prepare = [](FaultCase& tested) {
    tested.scripts[0]->Set(tested.Fails(Unreachable()));
    // The second one fails in the first round.
    tested.scripts[1]->Set([&tested](const AttemptRequest&, Limit&) {
      return tested.Attempts() < 4 ? Unavailable(seconds(0)) : Issued(tested.NewToken(hours(1)));
    });
    tested.Make();
  };
  const auto run = [](FaultCase& tested) {
    tested.Call(tested.first, tested.spec);
    tested.runtime->Advance(minutes(2));
  };
  EXPECT_GT(FailEachAllocation({prepare, run, CheckFirst}), 20U);
}

TEST(CallFaultsTest, AllEndpointsFail) {
  const auto prepare = [](FaultCase& tested) {
    tested.ForAll(tested.Fails(Unreachable()));
    tested.Make();
  };
  const auto run = [](FaultCase& tested) {
    tested.Call(tested.first, tested.spec);
    tested.runtime->Advance(minutes(2));
  };
  const auto check = [](FaultCase& tested, bool) {
    EXPECT_EQ(tested.first.outcomes, 1);
    EXPECT_FALSE(tested.first.hasToken);
    tested.runtime->Advance(minutes(2));
    ExpectWorks(tested);
  };
  EXPECT_GT(FailEachAllocation({prepare, run, check}), 20U);
}

// However memory fails, a password that was refused is not sent again.
TEST(CallFaultsTest, Refusal) {
  int refusals = 0;
  const auto prepare = [&refusals](FaultCase& tested) {
    refusals = 0;
    tested.ForAll([&refusals](const AttemptRequest&, Limit&) {
      AttemptOutcome outcome = Refused();
      ++refusals;
      return outcome;
    });
    tested.Make();
  };
  const auto check = [&refusals](FaultCase& tested, bool) {
    EXPECT_EQ(tested.first.outcomes, 1);
    EXPECT_EQ(tested.second.outcomes, 1);
    for (int i = 0; i < 3; ++i) {
      EXPECT_TRUE(tested.Get(tested.spec).Is<InvalidCredentialsException>());
    }
    EXPECT_EQ(refusals, 1);
    tested.password = "changed";
    ExpectWorks(tested);
  };
  EXPECT_GT(FailEachAllocation({prepare, CallForTwoKeys, check}), 20U);
}

TEST(CallFaultsTest, WaitingForATurn) {
  const auto prepare = [](FaultCase& tested) {
    tested.config.endpoints.resize(1);
    tested.Make();
    EXPECT_NE(tested.Get(tested.SpecFor("accepted")).token, nullptr);
    // While the first one is under way, the others come.
    tested.scripts[0]->Set([&tested](const AttemptRequest&, Limit&) {
      tested.runtime->Settle();
      return Issued(tested.NewToken(hours(1)));
    });
  };
  EXPECT_GT(FailEachAllocation({prepare, CallForTwoKeys, CheckBoth}), 20U);
}

TEST(CallFaultsTest, Deadline) {
  const auto prepare = [](FaultCase& tested) {
    tested.scripts[0]->Set([&tested](const AttemptRequest&, Limit&) {
      tested.runtime->Pass(seconds(2));
      return Unreachable();
    });
    tested.Make();
  };
  const auto run = [](FaultCase& tested) {
    tested.Call(tested.first, tested.spec, tested.Within(seconds(1)));
    tested.runtime->Advance(seconds(5));
  };
  const auto check = [](FaultCase& tested, bool) {
    EXPECT_EQ(tested.first.outcomes, 1);
    EXPECT_FALSE(tested.first.hasToken);
    ExpectWorks(tested);
  };
  EXPECT_GT(FailEachAllocation({prepare, run, check}), 20U);
}

TEST(CallFaultsTest, Cancellation) {
  const auto run = [](FaultCase& tested) {
    try {
      const CancellationSource cancellation;
      CallContext context;
      context.cancellation = cancellation.Token();
      tested.Call(tested.first, tested.spec, context);
      tested.Call(tested.second, tested.spec);
      cancellation.Cancel();
    } catch (const std::bad_alloc&) {
      tested.first.Record(nullptr, &Tarnik::OutOfMemory());
      tested.second.Record(nullptr, &Tarnik::OutOfMemory());
    }
    tested.runtime->Settle();
  };
  const auto check = [](FaultCase& tested, bool hasHappened) {
    EXPECT_EQ(tested.first.outcomes, 1);
    EXPECT_FALSE(tested.first.hasToken);
    ExpectOneOutcome(tested.second, hasHappened);
    ExpectWorks(tested);
  };
  EXPECT_GT(FailEachAllocation({MakeSource, run, check}), 20U);
}

TEST(CallFaultsTest, BlockedCaller) {
  const auto run = [](FaultCase& tested) {
    CallEnd& end = tested.first;
    std::atomic<bool> isStarted{false};
    std::thread caller;
    try {
      caller = std::thread([&] {
        isStarted = true;
        try {
          end.Record(tested.source->GetToken(tested.spec, {}).get(), nullptr);
        } catch (const std::bad_alloc&) {
          end.Record(nullptr, &Tarnik::OutOfMemory());
        } catch (const Tarnik::Exception& failure) {
          end.Record(nullptr, &failure);
        }
      });
    } catch (const std::bad_alloc&) {
      end.Record(nullptr, &Tarnik::OutOfMemory());
    }
    while (end.outcomes == 0) {
      tested.runtime->Settle();
      std::this_thread::yield();
    }
    if (caller.joinable()) {
      caller.join();
    }
  };
  EXPECT_GT(FailEachAllocation({MakeSource, run, CheckFirst}), 20U);
}

}  // namespace
}  // namespace SsoClient::Access::Testing
