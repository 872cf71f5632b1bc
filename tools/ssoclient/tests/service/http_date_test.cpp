#include "service/http_date.h"

#include <gtest/gtest.h>

namespace SsoClient::Tool {
namespace {

TEST(HttpDateTest, DatesHaveOneForm) {
  EXPECT_EQ(ParseHttpDate("Sun, 06 Nov 1994 08:49:37 GMT"), 784111777);
  EXPECT_FALSE(ParseHttpDate("Sun, 06 Nov 1994 08:49:37 GMT+1"));
  EXPECT_FALSE(ParseHttpDate("1994-11-06T08:49:37Z"));
  EXPECT_FALSE(ParseHttpDate(""));
}

}  // namespace
}  // namespace SsoClient::Tool
