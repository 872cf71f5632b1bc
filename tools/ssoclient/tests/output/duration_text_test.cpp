#include "output/duration_text.h"

#include <gtest/gtest.h>

namespace SsoClient::Tool {
namespace {

using std::chrono::hours;
using std::chrono::minutes;
using std::chrono::seconds;
using Tarnik::System::DateTime;

TEST(DurationTextTest, HasTheLargestUnitAndTheNext) {
  EXPECT_EQ(DurationText(seconds(0)), "0 s");
  EXPECT_EQ(DurationText(seconds(59)), "59 s");
  EXPECT_EQ(DurationText(seconds(60)), "1 min");
  EXPECT_EQ(DurationText(seconds(185)), "3 min 5 s");
  EXPECT_EQ(DurationText(minutes(125)), "2 h 5 min");
  EXPECT_EQ(DurationText(hours(2) + seconds(59)), "2 h");
  EXPECT_EQ(DurationText(hours(24 * 31)), "31 d");
  EXPECT_EQ(DurationText(hours(49) + minutes(30)), "2 d 1 h");
  EXPECT_EQ(DurationText(hours(24) + minutes(59)), "1 d") << "two units beside each other only";
  EXPECT_EQ(DurationText(seconds(-185)), "3 min 5 s");
}

TEST(DurationTextTest, IsReadFromTheCommandLine) {
  EXPECT_EQ(ParseDuration("90"), seconds(90));
  EXPECT_EQ(ParseDuration("90s"), seconds(90));
  EXPECT_EQ(ParseDuration("5min"), minutes(5));
  EXPECT_EQ(ParseDuration("5m"), minutes(5));
  EXPECT_EQ(ParseDuration("8h"), hours(8));
  EXPECT_EQ(ParseDuration("31d"), hours(24 * 31));
  EXPECT_EQ(ParseDuration("0"), seconds(0));
}

TEST(DurationTextTest, NothingElseIsADuration) {
  for (const char* text : {"", "s", "-1", "+1", " 1", "1 ", "1 h", "1.5h", "1mi", "1H", "0x10",
                           "36501d", "9223372036854775807d", "99999999999999999999"}) {
    EXPECT_EQ(ParseDuration(text), std::nullopt) << text;
  }
  EXPECT_TRUE(ParseDuration("36500d"));
}

TEST(DurationTextTest, TimesAreInUtcToTheSecond) {
  EXPECT_EQ(TimeText(DateTime::Parse("2026-11-22T18:30:00.999+02:00")), "2026-11-22 16:30:00 UTC");
}

TEST(DurationTextTest, SecondsAreRoundedDown) {
  const DateTime time = DateTime::Parse("2026-11-22T16:30:00Z");
  EXPECT_EQ(SecondsBetween(time, DateTime::Parse("2026-11-22T16:30:01.9Z")), seconds(1));
  EXPECT_EQ(SecondsBetween(time, DateTime::Parse("2026-11-22T16:29:59.9Z")), seconds(-1));
  EXPECT_EQ(SecondsBetween(time, time), seconds(0));
}

}  // namespace
}  // namespace SsoClient::Tool
