#include <gtest/gtest.h>

#include "support/source_fixture.h"

namespace SsoClient::Access::Testing {

namespace {

class KeptFreshTest : public SourceFixture {
 protected:
  // A spec that acts for the owner of a token that is valid for `lifetime`.
  TokenSpec ActingFor(milliseconds lifetime) {
    TokenSpec acting = spec;
    acting.actAsToken = std::shared_ptr<const SamlToken>(NewToken(lifetime));
    return acting;
  }
};

TEST_F(KeptFreshTest, TokensThatFillTheCacheAreNotEvicted) {
  config.cache.capacity = 1;
  config.keepFresh = {spec};
  Make();
  runtime->Settle();
  ASSERT_NE(source->TryGetToken(spec), nullptr);
  for (int i = 0; i < 5; ++i) {
    EXPECT_NE(Get(SpecFor(std::to_string(i))).token, nullptr);
    EXPECT_NE(source->TryGetToken(spec), nullptr);
  }
  // Beside them, there is room for one.
  EXPECT_NE(source->TryGetToken(SpecFor("4")), nullptr);
  EXPECT_EQ(source->TryGetToken(SpecFor("3")), nullptr);
  EXPECT_EQ(source->Metrics().keys, 2U);
  EXPECT_EQ(source->Metrics().evictions, 4U);
  runtime->Advance(hours(24));
  EXPECT_NE(source->TryGetToken(spec), nullptr);
}

TEST_F(KeptFreshTest, WallClockThatIsSetBackDoesNotEndTheKeeping) {
  const TokenSpec acting = ActingFor(hours(24));
  config.keepFresh = {acting};
  Make();
  runtime->Settle();
  ASSERT_NE(source->TryGetToken(acting), nullptr);
  runtime->MoveWallClock(hours(48));
  runtime->Advance(hours(1));
  EXPECT_EQ(source->TryGetToken(acting), nullptr);
  runtime->MoveWallClock(-hours(48));
  runtime->Advance(minutes(10));
  EXPECT_NE(source->TryGetToken(acting), nullptr);
}

TEST_F(KeptFreshTest, NothingIsRequestedAfterTheEndOfTheActAsToken) {
  config.keepFresh = {ActingFor(hours(2))};
  Make();
  runtime->Advance(hours(3));
  const std::size_t attempts = Attempts();
  runtime->Advance(hours(24));
  EXPECT_EQ(Attempts(), attempts);
}

}  // namespace

}  // namespace SsoClient::Access::Testing
