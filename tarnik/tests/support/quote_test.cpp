#include "support/quote.h"

#include <string>
#include <string_view>

#include <gtest/gtest.h>

namespace Tarnik::Testing {
namespace {

TEST(QuoteTest, IsEnclosedInApostrophes) {
  EXPECT_EQ(Quote("text"), "'text'");
  EXPECT_EQ(Quote(""), "''");
}

TEST(QuoteTest, ReplacesWhatIsNotPrintableAscii) {
  EXPECT_EQ(Quote(std::string_view("a\0\n\x7F\xC3\xA4~ ", 8)), "'a?????~ '");
}

TEST(QuoteTest, IsTruncatedAfter120Bytes) {
  EXPECT_EQ(Quote(std::string(120, 'x')), "'" + std::string(120, 'x') + "'");
  EXPECT_EQ(Quote(std::string(121, 'x')), "'" + std::string(120, 'x') + "...'");
}

}  // namespace
}  // namespace Tarnik::Testing
