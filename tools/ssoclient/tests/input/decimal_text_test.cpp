#include "input/decimal_text.h"

#include <gtest/gtest.h>

namespace SsoClient::Tool {
namespace {

TEST(DecimalTextTest, DigitsAreANumber) {
  for (const char* text : {"0", "7", "10", "999"}) {
    EXPECT_TRUE(IsDecimal(text, 3)) << text;
  }
}

TEST(DecimalTextTest, EverythingElseIsNot) {
  for (const char* text : {"", "1000", "010", "00", "-1", "+1", " 1", "1 ", "0x1", "1.0", "1e2"}) {
    EXPECT_FALSE(IsDecimal(text, 3)) << text;
  }
}

}  // namespace
}  // namespace SsoClient::Tool
