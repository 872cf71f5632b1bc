#include "support/quote.h"

#include <gtest/gtest.h>

namespace Tarnik {
namespace {

TEST(Quote, StandsBetweenApostrophes) {
  EXPECT_EQ(Quote("text"), "'text'");
  EXPECT_EQ(Quote(""), "''");
}

TEST(Quote, HidesWhatIsNotPrintableAscii) {
  EXPECT_EQ(Quote(std::string_view("a\0\n\x7F\xC3\xA4~ ", 8)), "'a?????~ '");
}

TEST(Quote, IsCutAfter120Bytes) {
  EXPECT_EQ(Quote(std::string(120, 'x')), "'" + std::string(120, 'x') + "'");
  EXPECT_EQ(Quote(std::string(121, 'x')), "'" + std::string(120, 'x') + "...'");
}

}  // namespace
}  // namespace Tarnik
