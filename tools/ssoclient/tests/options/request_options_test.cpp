#include "options/request_options.h"

#include <gtest/gtest.h>

namespace SsoClient::Tool {
namespace {

TEST(RequestOptionsTest, LifetimesHaveUnits) {
  EXPECT_EQ(ParseLifetime("3600"), 3600);
  EXPECT_EQ(ParseLifetime("90s"), 90);
  EXPECT_EQ(ParseLifetime("30m"), 1800);
  EXPECT_EQ(ParseLifetime("30min"), 1800);
  EXPECT_EQ(ParseLifetime("8h"), 8 * 3600);
  EXPECT_EQ(ParseLifetime("7d"), 7 * 24 * 3600);
  EXPECT_EQ(ParseLifetime("36500d"), std::int64_t{36500} * 24 * 3600);
}

TEST(RequestOptionsTest, OtherTextsAreNotLifetimes) {
  for (const char* const text : {"", "0", "0h", "-1", "+1", "1.5h", "h", "8 h", " 8h", "8H", "8hh",
                                 "36501d", "99999999999999999999", "9223372036854775807d"}) {
    EXPECT_EQ(ParseLifetime(text), std::nullopt) << text;
  }
}

}  // namespace
}  // namespace SsoClient::Tool
