#include <functional>
#include <string>

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
  void ExpectInvalid(const std::function<void(GateConfig&)>& change,
                     const std::string& message) const {
    GateConfig changed = config;
    change(changed);
    try {
      CreateTokenGate(changed);
      ADD_FAILURE() << "not thrown: " << message;
    } catch (const Tarnik::InvalidArgumentException& e) {
      EXPECT_EQ(e.Message(), message);
    }
  }
};

TEST_F(GateConfigCheckTest, Trust) {
  ExpectInvalid([](GateConfig& changed) { changed.trust = nullptr; },
                "The trust store of the gate (trust) is null.");
  ExpectInvalid([](GateConfig& changed) { changed.trust = std::make_shared<OwnTrustStore>(); },
                "The trust store of the gate (trust) was not created by CreateTrustStore.");
}

TEST_F(GateConfigCheckTest, Audiences) {
  ExpectInvalid([](GateConfig& changed) { changed.audiences = {}; },
                "The gate has no audience (audiences).");
  ExpectInvalid(
      [](GateConfig& changed) {
        changed.audiences = {kAudience, ""};
      },
      "An audience of the gate (audiences) is empty.");
}

TEST_F(GateConfigCheckTest, BearerTokens) {
  const std::string message =
      "It is not said whether the gate accepts bearer tokens (bearerTokens).";
  ExpectInvalid([](GateConfig& changed) { changed.bearerTokens = BearerTokens::kNotSaid; },
                message);
  ExpectInvalid([](GateConfig& changed) { changed.bearerTokens = static_cast<BearerTokens>(9); },
                message);
}

TEST_F(GateConfigCheckTest, Numbers) {
  ExpectInvalid([](GateConfig& changed) { changed.clockTolerance = std::chrono::seconds(-1); },
                "The clock tolerance of the gate (clockTolerance) is negative.");
  ExpectInvalid([](GateConfig& changed) { changed.longestLifetime = std::chrono::seconds(0); },
                "The longest lifetime of the gate's tokens (longestLifetime) is not positive.");
  ExpectInvalid([](GateConfig& changed) { changed.largestToken = 0; },
                "The size of the gate's largest token (largestToken) is 0.");
}

TEST_F(GateConfigCheckTest, AllowedGroups) {
  ExpectInvalid(
      [](GateConfig& changed) {
        changed.allowedGroups = {{"staff", "EXAMPLE"}, {}};
      },
      "The name of an allowed group of the gate (allowedGroups) is empty.");
  config.allowedGroups = {{"staff", ""}};
  EXPECT_NO_THROW(CreateTokenGate(config));
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
