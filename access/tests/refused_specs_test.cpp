#include "refused_specs.h"

#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>

#include "support/issued_token.h"

namespace SsoClient::Access::Testing {

namespace {

using std::chrono::minutes;
using std::chrono::seconds;

TokenSpec Numbered(int number) {
  TokenSpec spec;
  spec.tokenLifetimeSec = 3600;
  spec.audienceRestriction = {std::to_string(number)};
  return spec;
}

class RefusedSpecsTest : public ::testing::Test {
 protected:
  bool IsKnown(const TokenSpec& spec, RefusedSpecs::Tag secret = 0) const {
    return refused.Find(spec, secret, now).IsSet();
  }

  RefusedSpecs refused{3, minutes(5)};
  Instant::Steady now{std::chrono::hours(1)};
  const Failure refusal = Failure::Of(InvalidCredentialsException("Wrong."));
};

TEST_F(RefusedSpecsTest, RemembersForTheStatedTime) {
  EXPECT_FALSE(IsKnown(Numbered(1)));
  refused.Remember(Numbered(1), 0, refusal, now);
  EXPECT_THROW(refused.Find(Numbered(1), 0, now).Throw(), InvalidCredentialsException);
  EXPECT_FALSE(IsKnown(Numbered(2)));
  EXPECT_FALSE(IsKnown(Numbered(1), 7));
  now += minutes(5);
  EXPECT_FALSE(IsKnown(Numbered(1)));
}

TEST_F(RefusedSpecsTest, ForgetsTheOldestWhenItIsFull) {
  for (int i = 0; i < 3; ++i) {
    refused.Remember(Numbered(i), 0, refusal, now);
  }
  refused.Remember(Numbered(0), 0, refusal, now);  // now the newest
  refused.Remember(Numbered(3), 0, refusal, now);
  EXPECT_EQ(refused.Size(), 3U);
  EXPECT_TRUE(IsKnown(Numbered(0)));
  EXPECT_FALSE(IsKnown(Numbered(1)));
  EXPECT_TRUE(IsKnown(Numbered(2)));
  EXPECT_TRUE(IsKnown(Numbered(3)));
}

TEST_F(RefusedSpecsTest, DropsWhatIsOver) {
  refused.Remember(Numbered(1), 0, refusal, now);
  now += minutes(3);
  refused.Remember(Numbered(2), 0, refusal, now);
  now += minutes(2);
  refused.Remember(Numbered(3), 0, refusal, now);
  EXPECT_EQ(refused.Size(), 2U);
}

TEST_F(RefusedSpecsTest, SuccessForgets) {
  refused.Remember(Numbered(1), 0, refusal, now);
  refused.Forget(Numbered(2), 0);
  EXPECT_TRUE(IsKnown(Numbered(1)));
  refused.Forget(Numbered(1), 0);
  EXPECT_FALSE(IsKnown(Numbered(1)));
  EXPECT_EQ(refused.Size(), 0U);
}

TEST_F(RefusedSpecsTest, EveryFieldCounts) {
  refused.Remember(Numbered(1), 0, refusal, now);
  TokenSpec spec = Numbered(1);
  EXPECT_TRUE(IsKnown(spec));
  spec.tokenLifetimeSec = 60;
  EXPECT_FALSE(IsKnown(spec));
  spec = Numbered(1);
  spec.delegable = !spec.delegable;
  EXPECT_FALSE(IsKnown(spec));
  spec = Numbered(1);
  spec.renewable = !spec.renewable;
  EXPECT_FALSE(IsKnown(spec));
  spec = Numbered(1);
  spec.delegateTo = std::string();
  EXPECT_FALSE(IsKnown(spec));
  spec = Numbered(1);
  spec.audienceRestriction.insert("2");
  EXPECT_FALSE(IsKnown(spec));
  spec = Numbered(1);
  spec.advice.push_back({"source", {{"name", {"value"}}}});
  EXPECT_FALSE(IsKnown(spec));
  spec = Numbered(1);
  spec.actAsToken = std::shared_ptr<const SamlToken>(std::make_shared<IssuedToken>("_1", 0, 1));
  EXPECT_FALSE(IsKnown(spec));
  refused.Remember(spec, 0, refusal, now);
  spec.actAsToken = std::shared_ptr<const SamlToken>(std::make_shared<IssuedToken>("_2", 0, 1));
  EXPECT_FALSE(IsKnown(spec));
}

}  // namespace

}  // namespace SsoClient::Access::Testing
