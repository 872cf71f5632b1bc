#include "token/validity.h"

#include <gtest/gtest.h>

namespace SsoClient::Tool {
namespace {

using State = Validity::State;
using Tarnik::System::DateTime;

Validity At(const char* now) {
  return {DateTime::Parse("2026-11-22T16:00:00Z"), DateTime::Parse("2026-11-22T18:00:00Z"),
          DateTime::Parse(now)};
}

TEST(ValidityTest, TheStartIsInThePeriodAndTheEndIsNot) {
  EXPECT_EQ(At("2026-11-22T15:59:59.999999Z").GetState(), State::kNotYetValid);
  EXPECT_EQ(At("2026-11-22T16:00:00Z").GetState(), State::kValid);
  EXPECT_EQ(At("2026-11-22T17:59:59.999999Z").GetState(), State::kValid);
  EXPECT_EQ(At("2026-11-22T18:00:00Z").GetState(), State::kExpired);
}

TEST(ValidityTest, SaysHowLong) {
  EXPECT_EQ(At("2026-11-22T15:50:00Z").ToString(), "not valid yet: valid in 10 min");
  EXPECT_EQ(At("2026-11-22T16:55:00Z").ToString(), "valid for 1 h 5 min");
  EXPECT_EQ(At("2026-11-22T18:03:00Z").ToString(), "expired 3 min ago");
  EXPECT_STREQ(At("2026-11-22T15:50:00Z").StateName(), "not-yet-valid");
  EXPECT_STREQ(At("2026-11-22T16:55:00Z").StateName(), "valid");
  EXPECT_STREQ(At("2026-11-22T18:03:00Z").StateName(), "expired");
}

TEST(ValidityTest, ThePositionIsAPartOfThePeriod) {
  EXPECT_LT(At("2026-11-22T15:50:00Z").Position(), 0);
  EXPECT_EQ(At("2026-11-22T16:00:00Z").Position(), 0);
  EXPECT_EQ(At("2026-11-22T16:30:00Z").Position(), 0.25);
  EXPECT_EQ(At("2026-11-22T18:00:00Z").Position(), 1);
  EXPECT_EQ(At("2026-11-22T15:50:00Z").Percent(), 0);
  EXPECT_EQ(At("2026-11-22T16:30:00Z").Percent(), 25);
  EXPECT_EQ(At("2026-11-22T17:59:59Z").Percent(), 99) << "not 100 before the end";
  EXPECT_EQ(At("2026-11-22T19:00:00Z").Percent(), 100);
}

TEST(ValidityTest, APeriodMayBeEmptyOrAsLongAsAllTime) {
  const DateTime first = DateTime::Parse("0001-01-01T00:00:00Z");
  const DateTime last = DateTime::Parse("9999-12-31T23:59:59Z");
  const DateTime middle = DateTime::Parse("2026-11-22T16:00:00Z");
  EXPECT_EQ((Validity{first, last, middle}.GetState()), State::kValid);
  EXPECT_EQ((Validity{first, last, middle}.Percent()), 20);
  EXPECT_GE((Validity{middle, middle, middle}.Position()), 1);
  EXPECT_GE((Validity{middle, middle, last}.Position()), 1);
  EXPECT_LT((Validity{middle, middle, first}.Position()), 0);
}

}  // namespace
}  // namespace SsoClient::Tool
