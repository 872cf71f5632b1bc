#include "output/count_text.h"

#include <gtest/gtest.h>

namespace SsoClient::Tool {
namespace {

TEST(CountTextTest, OnlyOneIsSingular) {
  EXPECT_EQ(CountText(0, "day"), "0 days");
  EXPECT_EQ(CountText(1, "day"), "1 day");
  EXPECT_EQ(CountText(2, "day"), "2 days");
  EXPECT_EQ(CountText(1, "address", "es"), "1 address");
  EXPECT_EQ(CountText(11, "address", "es"), "11 addresses");
}

}  // namespace
}  // namespace SsoClient::Tool
