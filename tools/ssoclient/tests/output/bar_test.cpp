#include "output/bar.h"

#include <gtest/gtest.h>

#include "output/text_width.h"

namespace SsoClient::Tool {
namespace {

TEST(PeriodBarTest, TheMarkerMovesFromTheStartToTheEnd) {
  EXPECT_EQ(PeriodBar(0, 12, false), "[|---------]");
  EXPECT_EQ(PeriodBar(0.5, 12, false), "[=====|----]");
  EXPECT_EQ(PeriodBar(0.999, 12, false), "[=========|]");
}

TEST(PeriodBarTest, TheMarkerIsOutsideBeforeTheStartAndAfterTheEnd) {
  EXPECT_EQ(PeriodBar(-0.001, 12, false), "| [--------]");
  EXPECT_EQ(PeriodBar(1, 12, false), "[========] |");
  EXPECT_EQ(PeriodBar(1e18, 12, false), "[========] |");
  EXPECT_EQ(PeriodBar(-1e18, 12, false), "| [--------]");
}

TEST(PeriodBarTest, IsDrawnWithLinesInUtf8) {
  EXPECT_EQ(PeriodBar(0.5, 12, true), "├━━━━━●────┤");
  EXPECT_EQ(PeriodBar(2, 12, true), "├━━━━━━━━┤ ●");
}

TEST(PeriodBarTest, HasItsWidth) {
  for (std::size_t width = 8; width < 100; ++width) {
    for (const double position : {-1.0, 0.0, 0.01, 0.3, 0.5, 0.99, 0.9999999, 1.0, 2.0}) {
      EXPECT_EQ(DisplayWidth(PeriodBar(position, width, true)), width) << position;
      EXPECT_EQ(PeriodBar(position, width, false).size(), width) << position;
    }
  }
  EXPECT_EQ(PeriodBar(0.5, 0, false).size(), 8U);
}

}  // namespace
}  // namespace SsoClient::Tool
