#include "xml/xml_date_time.h"

#include <cstdint>
#include <limits>

#include <gtest/gtest.h>

#include <tarnik/system/date_time.h>

#include "support/local_zone.h"

namespace SsoClient::Testing {
namespace {

using Tarnik::System::DateTime;
using Tarnik::System::DateTimeFromUtc;

TEST(XmlDateTimeTest, FormatsEveryFieldZeroFilled) {
  const struct {
    const char* time;
    const char* expected;
  } kCases[] = {
      {"2024-03-05T07:08:09.010Z", "2024-03-05T07:08:09.010Z"},
      {"2024-03-05T07:08:09.005Z", "2024-03-05T07:08:09.005Z"},
      {"2024-03-05T07:08:09Z", "2024-03-05T07:08:09.000Z"},
      {"2024-12-31T23:59:59.999999Z", "2024-12-31T23:59:59.999Z"},
      {"0001-01-01T00:00:00Z", "0001-01-01T00:00:00.000Z"},
      {"9999-12-31T23:59:59.999Z", "9999-12-31T23:59:59.999Z"},
      {"2000-02-29T12:30:00.1Z", "2000-02-29T12:30:00.100Z"},
      {"2024-03-05T07:08:09+05:30", "2024-03-05T07:08:09.000+05:30"},
      {"2024-03-05T07:08:09-11:00", "2024-03-05T07:08:09.000-11:00"},
  };
  for (const auto& test : kCases) {
    EXPECT_EQ(FormatXmlDateTime(DateTime::Parse(test.time)), test.expected);
  }
}

TEST(XmlDateTimeTest, FormatsNegativeInstants) {
  EXPECT_EQ(FormatXmlDateTime(DateTimeFromUtc(-1, false)), "1969-12-31T23:59:59.999Z");
}

TEST(XmlDateTimeTest, AddsMinutesExactlyUpTo35) {
  const auto start = DateTime::Parse("2024-03-05T07:08:09.010007Z");
  EXPECT_EQ(AddMinutes(start, 0), start);
  EXPECT_EQ(AddMinutes(start, 10).GetUtcTime() - start.GetUtcTime(), 600'000'000);
  EXPECT_EQ(AddMinutes(start, 35).GetUtcTime() - start.GetUtcTime(), 2'100'000'000);
}

TEST(XmlDateTimeTest, WrapsTheMicrosecondsBeyond35Minutes) {
  const auto start = DateTime::Parse("2024-03-05T07:08:09Z");
  const struct {
    std::uint32_t minutes;
    long microseconds;
  } kCases[] = {
      {36, 2'160'000'000 - 4'294'967'296},
      {71, 4'260'000'000 - 4'294'967'296},
      {72, 4'320'000'000 - 4'294'967'296},
      {std::numeric_limits<std::uint32_t>::max(), -60'000'000},
  };
  for (const auto& test : kCases) {
    EXPECT_EQ(AddMinutes(start, test.minutes).GetUtcTime() - start.GetUtcTime(), test.microseconds)
        << test.minutes;
  }
}

TEST(XmlDateTimeTest, GivesTheSumInUtc) {
  const LocalZone zone;
  EXPECT_EQ(FormatXmlDateTime(AddMinutes(DateTime::Parse("2024-03-05T07:08:09+01:00"), 1)),
            "2024-03-05T06:09:09.000Z");
}

TEST(XmlDateTimeTest, StopsAtTheEndOfTime) {
  const auto last = DateTime::Parse("9999-12-31T23:59:59.999999Z");
  EXPECT_EQ(AddMinutes(last, 10), last);
}

}  // namespace
}  // namespace SsoClient::Testing
