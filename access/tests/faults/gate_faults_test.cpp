// Single allocations that fail while a gate checks a token.
#include <new>
#include <optional>

#include "faults/failing_allocation.h"
#include "gate/gate_fixture.h"

namespace SsoClient::Access::Testing {
namespace {

class GateFaultsTest : public GateFixture {
 protected:
  // Checks with each allocation failing, until none fails, with the gate that `make` returns.
  // Returns how many have failed. Afterwards the gate works.
  template <class MakeGate>
  std::size_t FailEach(const MakeGate& make, const std::string& xml, Reason expected) {
    std::size_t index = 0;
    for (bool hasHappened = true; hasHappened; ++index) {
      SCOPED_TRACE(index);
      const std::shared_ptr<TokenGate> gate = make();
      std::optional<Reason> reason;
      {
        const FailingAllocation failure(index);
        try {
          reason = gate->Check(xml, presenter).Refusal();
        } catch (const std::bad_alloc&) {
          reason.reset();
        }
        hasHappened = failure.HasHappened();
      }
      EXPECT_EQ(reason.has_value(), !hasHappened);
      EXPECT_EQ(reason.value_or(expected), expected);
      EXPECT_EQ(gate->Check(xml, presenter).Refusal(), expected);
      if (HasFailure()) {
        break;
      }
    }
    return index;
  }

  const Presenter presenter = Presenter::WithTlsCertificate(CertificateOf(HolderCredential()));
  const std::string token = Signed(HolderOfKeyText());
};

TEST_F(GateFaultsTest, Miss) {
  EXPECT_GT(FailEach([this] { return Make(); }, token, Reason::kNone), 50U);
}

TEST_F(GateFaultsTest, Hit) {
  const auto make = [this] {
    auto gate = Make();
    EXPECT_TRUE(gate->Check(token, presenter).IsAccepted());
    return gate;
  };
  const std::size_t allocations = FailEach(make, token, Reason::kNone);
  EXPECT_GT(allocations, 1U);
  EXPECT_LT(allocations, 6U);
}

TEST_F(GateFaultsTest, ForgedToken) {
  const std::string forged = Replaced(token, "alice@", "admin@");
  EXPECT_GT(FailEach([this] { return Make(); }, forged, Reason::kBadSignature), 50U);
}

TEST_F(GateFaultsTest, WrongAudience) {
  config.audiences = {"https://c.example"};
  EXPECT_GT(FailEach([this] { return Make(); }, token, Reason::kWrongAudience), 50U);
}

TEST_F(GateFaultsTest, Ledger) {
  const Verdict verdict = Check(token, presenter);
  const std::string expected = verdict.ToString();
  std::size_t index = 0;
  for (bool hasHappened = true; hasHappened; ++index) {
    const FailingAllocation failure(index);
    try {
      EXPECT_EQ(verdict.ToString(), expected);
    } catch (const std::bad_alloc&) {
      EXPECT_TRUE(failure.HasHappened());
    }
    hasHappened = failure.HasHappened();
  }
  EXPECT_GT(index, 20U);
}

}  // namespace
}  // namespace SsoClient::Access::Testing
