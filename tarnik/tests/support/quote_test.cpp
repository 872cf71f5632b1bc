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

TEST(QuoteVerbatimTest, IsUnchangedUpTo120Bytes) {
  const std::string umlaut = "\xC3\xA4";
  EXPECT_EQ(QuoteVerbatim("p:n" + umlaut), "'p:n" + umlaut + "'");
  EXPECT_EQ(QuoteVerbatim(std::string(120, 'x')), "'" + std::string(120, 'x') + "'");
  EXPECT_EQ(QuoteVerbatim(std::string(121, 'x')), "'" + std::string(120, 'x') + "...'");
  EXPECT_EQ(QuoteVerbatim(std::string(119, 'x') + umlaut), "'" + std::string(119, 'x') + "...'");
}

}  // namespace
}  // namespace Tarnik::Testing
