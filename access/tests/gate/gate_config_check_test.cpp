#include <functional>

#include <tarnik/core/exception.h>

#include "gate/gate_fixture.h"

namespace SsoClient::Access::Testing {
namespace {

class OwnTrustStore final : public TrustStore {
 public:
  void Reload() override {}
  TrustDescription Describe() const override { return {}; }
};

class GateConfigCheckTest : public GateFixture {
 protected:
  void ExpectInvalid(const std::function<void(GateConfig&)>& change) const {
    GateConfig changed = config;
    change(changed);
    EXPECT_THROW(CreateTokenGate(changed), Tarnik::InvalidArgumentException);
  }
};

TEST_F(GateConfigCheckTest, Trust) {
  ExpectInvalid([](GateConfig& changed) { changed.trust = nullptr; });
  ExpectInvalid([](GateConfig& changed) { changed.trust = std::make_shared<OwnTrustStore>(); });
}

TEST_F(GateConfigCheckTest, Audiences) {
  ExpectInvalid([](GateConfig& changed) { changed.audiences = {}; });
  ExpectInvalid([](GateConfig& changed) { changed.audiences = {kAudience, ""}; });
}

TEST_F(GateConfigCheckTest, BearerTokens) {
  ExpectInvalid([](GateConfig& changed) { changed.bearerTokens = BearerTokens::kNotSaid; });
  ExpectInvalid([](GateConfig& changed) { changed.bearerTokens = static_cast<BearerTokens>(9); });
}

TEST_F(GateConfigCheckTest, Numbers) {
  ExpectInvalid([](GateConfig& changed) { changed.clockTolerance = std::chrono::seconds(-1); });
  ExpectInvalid([](GateConfig& changed) { changed.longestLifetime = std::chrono::seconds(0); });
  ExpectInvalid([](GateConfig& changed) { changed.largestToken = 0; });
}

TEST_F(GateConfigCheckTest, DefaultsWithWhatMustBeSaid) {
  EXPECT_NE(CreateTokenGate(config), nullptr);
  EXPECT_EQ(GateConfig{}.bearerTokens, BearerTokens::kNotSaid);
  EXPECT_FALSE(GateConfig{}.acceptsUnrestrictedTokens);
}

// Those of the guide's table of limits.
TEST_F(GateConfigCheckTest, DefaultsOfLimits) {
  const GateConfig limits;
  EXPECT_EQ(limits.clockTolerance, std::chrono::minutes(5));
  EXPECT_EQ(limits.longestLifetime, std::chrono::hours(31 * 24));
  EXPECT_EQ(limits.deepestDelegation, 10U);
  EXPECT_EQ(limits.largestToken, 262'144U);
  EXPECT_EQ(limits.cache.tokens, 10'000U);
  EXPECT_EQ(limits.cache.bytes, 67'108'864U);
}

}  // namespace
}  // namespace SsoClient::Access::Testing
